// Runs pack jobs on all cores and hands their results over in order. The workers stay only a few jobs ahead of the
// taker, so that the memory does not grow with the files.
#pragma once

#include <cstddef>
#include <exception>
#include <memory>
#include <span>
#include <thread>
#include <vector>

#include "core/lock.h"
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
  // stays until the next call. Throws what a worker threw over this job.
  const PackedJob& Next();

 private:
  // Job i uses slot i modulo their number. A slot belongs to its worker until it is ready, then to the taker.
  struct Slot {
    PackedJob packed;
    std::exception_ptr failure;
    bool isReady = false;
  };

  void Stop();
  void Work();
  std::shared_ptr<const SourceFile> SourceOf(const PackJob& job);  // m_mutex is held; in the order of the jobs
  Slot& SlotOf(size_t job) { return m_slots[job % m_slots.size()]; }

  const std::span<const FileRecord> m_files;
  const std::span<const PackJob> m_jobs;
  std::vector<Slot> m_slots;

  SharedLock m_mutex;  // guards the rest, and the slots' isReady
  Condition m_slotReady;
  Condition m_slotFree;
  size_t m_claimed = 0;      // jobs that workers took
  size_t m_returned = 0;     // … whose slots the taker gave back
  bool m_isHolding = false;  // the taker has the result of job m_returned
  bool m_isStopping = false;
  // Opened for a file's first piece and closed after its last: all pieces are of the same file, whatever becomes of its
  // name meanwhile.
  std::shared_ptr<const SourceFile> m_pieceSource;

  std::vector<std::thread> m_threads;
};

}  // namespace stutil
