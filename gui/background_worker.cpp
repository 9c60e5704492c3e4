#include "gui/background_worker.h"

#include <utility>

namespace qx {

BackgroundWorker::~BackgroundWorker() {
  {
    const std::lock_guard lock(m_mutex);
    m_isEnding = true;
  }
  m_changed.notify_one();
  if (m_thread.joinable()) m_thread.join();
}

bool BackgroundWorker::Post(std::function<void()> job) {
  {
    const std::lock_guard lock(m_mutex);
    if (m_isEnding || m_jobs.size() >= kMostJobs) return false;
    m_jobs.push_back(std::move(job));
    if (!m_thread.joinable()) m_thread = std::thread(&BackgroundWorker::Run, this);
  }
  m_changed.notify_one();
  return true;
}

void BackgroundWorker::Run() {
  std::unique_lock lock(m_mutex);
  for (;;) {
    m_changed.wait(lock, [this] { return m_isEnding || !m_jobs.empty(); });
    if (m_isEnding) return;
    const std::function<void()> job = std::move(m_jobs.front());
    m_jobs.pop_front();
    lock.unlock();
    job();
    lock.lock();
  }
}

}  // namespace qx
