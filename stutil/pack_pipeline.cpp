#include "stutil/pack_pipeline.h"

#include <algorithm>
#include <utility>

namespace stutil {
namespace {

// More workers than this only cost memory: one thread writes the archive.
constexpr size_t kMostWorkers = 8;
constexpr size_t kJobsAhead = 3;  // finished ones, beside one in work on each worker

// One more than there are cores, because a worker that opens a file waits for the system.
size_t WorkerCount(size_t jobs) {
  return std::min({size_t{std::thread::hardware_concurrency()} + 1, kMostWorkers, jobs});
}

}  // namespace

PackPipeline::PackPipeline(std::span<const FileRecord> files, std::span<const PackJob> jobs)
    : m_files(files), m_jobs(jobs), m_slots(WorkerCount(jobs.size()) + kJobsAhead) {
  const size_t workers = WorkerCount(jobs.size());
  m_threads.reserve(workers);
  try {
    while (m_threads.size() < workers)
      m_threads.emplace_back(&PackPipeline::Work, this);
  } catch (...) {
    Stop();
    throw;
  }
}

PackPipeline::~PackPipeline() {
  Stop();
}

void PackPipeline::Stop() {
  {
    const std::lock_guard lock(m_mutex);
    m_isStopping = true;
  }
  m_slotFree.notify_all();
  for (std::thread& thread : m_threads)
    thread.join();
}

const PackedJob& PackPipeline::Next() {
  std::unique_lock lock(m_mutex);
  if (m_isHolding) {
    SlotOf(m_returned).isReady = false;
    ++m_returned;
    m_slotFree.notify_one();
  }
  m_isHolding = true;
  const Slot& slot = SlotOf(m_returned);
  m_slotReady.wait(lock, [&] { return slot.isReady; });
  if (slot.failure) std::rethrow_exception(slot.failure);
  return slot.packed;
}

void PackPipeline::Work() {
  std::unique_ptr<PackWorker> worker;
  std::unique_lock lock(m_mutex);
  for (;;) {
    m_slotFree.wait(
        lock, [this] { return m_isStopping || m_claimed == m_jobs.size() || m_claimed < m_returned + m_slots.size(); });
    if (m_isStopping || m_claimed == m_jobs.size()) return;
    const PackJob& job = m_jobs[m_claimed];
    Slot& slot = SlotOf(m_claimed++);
    try {
      const std::shared_ptr<const SourceFile> source = SourceOf(job);
      lock.unlock();
      if (!worker) worker = std::make_unique<PackWorker>();
      worker->Run(job, m_files, source.get(), slot.packed);
    } catch (...) {
      slot.failure = std::current_exception();
    }
    if (!lock.owns_lock()) lock.lock();
    slot.isReady = true;
    m_slotReady.notify_one();
  }
}

std::shared_ptr<const SourceFile> PackPipeline::SourceOf(const PackJob& job) {
  if (!job.isPiece) return nullptr;
  if (job.offset == 0) m_pieceSource = std::make_shared<const SourceFile>(m_files[job.firstFile].path);
  return job.isLastPiece ? std::exchange(m_pieceSource, nullptr) : m_pieceSource;
}

}  // namespace stutil
