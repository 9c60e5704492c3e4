// Runs pack jobs: one thread reads, one for each core compresses, and the caller takes the results in order. One
// reader, because it is the sequence of opening and closing files that takes its time, not the reading. Everybody stays
// only a few jobs ahead of the caller, so that the memory does not grow with the files.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <exception>
#include <mutex>
#include <span>
#include <thread>
#include <vector>

#include "stutil/pack_job.h"

namespace stutil {

class PackPipeline {
 public:
  // Both spans have to outlive the pipeline. Throws when memory or threads run out.
  PackPipeline(std::span<const FileRecord> files, std::span<const PackJob> jobs);

  // Ends the threads after their current jobs.
  ~PackPipeline();

  PackPipeline(const PackPipeline&) = delete;
  PackPipeline& operator=(const PackPipeline&) = delete;

  // Waits for the next job's result, the first job's first; to be called once for each job, on one thread. The result
  // stays until the next call. Throws what a thread threw over this job.
  const PackedJob& Next();

 private:
  // Job i uses slot i modulo their number. A slot belongs to the reader, then to one compressor, then to the caller.
  struct Slot {
    JobInput input;
    PackedJob packed;
    std::exception_ptr failure;
    bool isPacked = false;
  };

  void Start(size_t compressors);
  void Stop();
  void ReadJobs();
  void CompressJobs();
  Slot& SlotOf(size_t job) { return m_slots[job % m_slots.size()]; }

  const std::span<const FileRecord> m_files;
  const std::span<const PackJob> m_jobs;
  std::vector<Slot> m_slots;

  std::mutex m_mutex;  // guards the rest, and the slots' isPacked
  std::condition_variable m_changedForReader;
  std::condition_variable m_changedForCompressors;
  std::condition_variable m_changedForCaller;
  size_t m_read = 0;         // jobs that were read
  size_t m_claimed = 0;      // … that compressors took
  size_t m_returned = 0;     // … whose slots the caller gave back
  bool m_isHolding = false;  // the caller has the result of job m_returned
  bool m_isStopping = false;

  std::vector<std::thread> m_threads;
};

}  // namespace stutil
