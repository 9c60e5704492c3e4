// Runs pack jobs on all cores and hands their results over in order. Workers stay only a few jobs ahead of the taker, so
// that the memory does not grow with the files.
#pragma once

#include <condition_variable>
#include <exception>
#include <memory>
#include <mutex>
#include <span>
#include <thread>
#include <vector>

#include "stutil/pack_worker.h"

namespace stutil {

class PackPipeline {
 public:
  // Both spans have to outlive the pipeline. Throws when memory or threads run out.
  PackPipeline(std::span<const FileRecord> files, std::span<const PackJob> jobs);

  // Ends the workers after their current jobs.
  ~PackPipeline();

  PackPipeline(const PackPipeline&) = delete;
  PackPipeline& operator=(const PackPipeline&) = delete;

  // Waits for the next job's result, the first job's first; to be called once for each job, on one thread. The result
  // stays until the next call. Throws what the worker threw.
  const PackedJob& Next();

 private:
  struct Slot {
    PackedJob packed;
    std::exception_ptr failure;
    bool isReady = false;
  };

  void Work();
  std::shared_ptr<const SourceFile> SourceOf(const PackJob& job);  // under the lock, in the order of the jobs

  const std::span<const FileRecord> m_files;
  const std::span<const PackJob> m_jobs;

  std::mutex m_mutex;  // guards what follows; a slot belongs to its worker until it is ready, then to the taker
  std::condition_variable m_slotReady;
  std::condition_variable m_slotFree;
  std::vector<Slot> m_slots;                    // job i uses slot i modulo their number
  size_t m_claimed = 0;                         // jobs that workers took
  size_t m_taken = 0;                           // results that were handed over and given back
  bool m_isHolding = false;                     // the taker has the result of job m_taken
  bool m_isStopping = false;
  std::shared_ptr<const SourceFile> m_bigFile;  // that of the piece that was claimed last

  std::vector<std::thread> m_threads;
};

}  // namespace stutil
