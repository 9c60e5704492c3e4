#include "stutil/pack_pipeline.h"

#include <algorithm>
#include <system_error>

namespace stutil {
namespace {

// More threads than this only cost memory: the taker writes the archive alone.
constexpr size_t kMostThreads = 8;
constexpr size_t kJobsAhead = 4;  // finished ones, beside one in work on each thread

size_t ThreadCount(size_t jobs) {
  return std::min({size_t{std::max(1U, std::thread::hardware_concurrency())}, kMostThreads, jobs});
}

}  // namespace

PackPipeline::PackPipeline(std::span<const FileRecord> files, std::span<const PackJob> jobs)
    : m_files(files), m_jobs(jobs) {
  const size_t threads = ThreadCount(jobs.size());
  m_slots.resize(threads + kJobsAhead);
  m_threads.reserve(threads);
  while (m_threads.size() < threads) {
    try {
      m_threads.emplace_back(&PackPipeline::Work, this);
    } catch (const std::system_error&) {
      if (m_threads.empty()) throw;
      break;  // fewer do it too
    }
  }
}

PackPipeline::~PackPipeline() {
  {
    const std::lock_guard lock(m_mutex);
    m_isStopping = true;
  }
  m_slotFree.notify_all();
  for (std::thread& thread : m_threads) thread.join();
}

const PackedJob& PackPipeline::Next() {
  std::unique_lock lock(m_mutex);
  if (m_isHolding) {
    m_slots[m_taken % m_slots.size()].isReady = false;
    ++m_taken;
    m_slotFree.notify_one();
  }
  m_isHolding = true;
  const Slot& slot = m_slots[m_taken % m_slots.size()];
  m_slotReady.wait(lock, [&] { return slot.isReady; });
  if (slot.failure) std::rethrow_exception(slot.failure);
  return slot.packed;
}

void PackPipeline::Work() {
  std::unique_ptr<PackWorker> worker;
  std::unique_lock lock(m_mutex);
  for (;;) {
    m_slotFree.wait(lock, [this] {
      return m_isStopping || m_claimed == m_jobs.size() || m_claimed < m_taken + m_slots.size();
    });
    if (m_isStopping || m_claimed == m_jobs.size()) return;
    const PackJob& job = m_jobs[m_claimed];
    Slot& slot = m_slots[m_claimed % m_slots.size()];
    ++m_claimed;
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
  if (job.offset == 0) m_bigFile = std::make_shared<SourceFile>(m_files[job.firstFile].path);
  return job.isLastPiece ? std::move(m_bigFile) : m_bigFile;
}

}  // namespace stutil
