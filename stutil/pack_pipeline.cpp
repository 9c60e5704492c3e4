#include "stutil/pack_pipeline.h"

#include <algorithm>
#include <system_error>

namespace stutil {
namespace {

// More compressors than this only cost memory: one caller writes the archive.
constexpr size_t kMostCompressors = 8;
constexpr size_t kJobsAhead = 3;  // read or finished ones, beside one in work on each compressor

size_t CompressorCount(size_t jobs) {
  return std::min({size_t{std::max(1U, std::thread::hardware_concurrency())}, kMostCompressors, jobs});
}

}  // namespace

PackPipeline::PackPipeline(std::span<const FileRecord> files, std::span<const PackJob> jobs)
    : m_files(files), m_jobs(jobs), m_slots(CompressorCount(jobs.size()) + kJobsAhead) {
  try {
    Start(CompressorCount(jobs.size()));
  } catch (...) {
    Stop();
    throw;
  }
}

PackPipeline::~PackPipeline() {
  Stop();
}

void PackPipeline::Start(size_t compressors) {
  m_threads.reserve(1 + compressors);
  m_threads.emplace_back(&PackPipeline::ReadJobs, this);
  while (m_threads.size() < 1 + compressors)
    m_threads.emplace_back(&PackPipeline::CompressJobs, this);
}

void PackPipeline::Stop() {
  {
    const std::lock_guard lock(m_mutex);
    m_isStopping = true;
  }
  m_changedForReader.notify_all();
  m_changedForCompressors.notify_all();
  for (std::thread& thread : m_threads)
    thread.join();
}

const PackedJob& PackPipeline::Next() {
  std::unique_lock lock(m_mutex);
  if (m_isHolding) {
    SlotOf(m_returned).isPacked = false;
    ++m_returned;
    m_changedForReader.notify_one();
  }
  m_isHolding = true;
  const Slot& slot = SlotOf(m_returned);
  m_changedForCaller.wait(lock, [&] { return slot.isPacked; });
  if (slot.failure) std::rethrow_exception(slot.failure);
  return slot.packed;
}

void PackPipeline::ReadJobs() {
  SourceReader reader;
  for (size_t job = 0; job < m_jobs.size(); ++job) {
    {
      std::unique_lock lock(m_mutex);
      m_changedForReader.wait(lock, [&] { return m_isStopping || job < m_returned + m_slots.size(); });
      if (m_isStopping) return;
    }
    Slot& slot = SlotOf(job);
    try {
      reader.Read(m_jobs[job], m_files, slot.input);
    } catch (...) {
      slot.failure = std::current_exception();
    }
    const std::lock_guard lock(m_mutex);
    ++m_read;
    m_changedForCompressors.notify_one();
  }
}

void PackPipeline::CompressJobs() {
  std::unique_ptr<Deflater> deflater;
  for (;;) {
    size_t job = 0;
    {
      std::unique_lock lock(m_mutex);
      m_changedForCompressors.wait(lock,
                                   [this] { return m_isStopping || m_claimed < m_read || m_claimed == m_jobs.size(); });
      if (m_isStopping || m_claimed == m_jobs.size()) return;
      job = m_claimed++;
      if (m_claimed == m_jobs.size()) m_changedForCompressors.notify_all();
    }
    Slot& slot = SlotOf(job);
    try {
      if (!deflater) deflater = std::make_unique<Deflater>();
      if (!slot.failure) CompressJob(m_jobs[job], slot.input, *deflater, slot.packed);
    } catch (...) {
      slot.failure = std::current_exception();
    }
    const std::lock_guard lock(m_mutex);
    slot.isPacked = true;
    m_changedForCaller.notify_one();
  }
}

}  // namespace stutil
