#include "companions/upload/worker.h"

#include <utility>

namespace qxlink {

Worker::~Worker() {
  {
    const std::lock_guard lock(m_mutex);
    m_isEnding = true;
  }
  m_changed.notify_one();
  if (m_thread.joinable()) m_thread.join();
}

void Worker::Give(std::function<void()> job) {
  {
    const std::lock_guard lock(m_mutex);
    if (!m_thread.joinable()) m_thread = std::thread(&Worker::Run, this);
    m_jobs.push_back(std::move(job));
  }
  m_changed.notify_one();
}

void Worker::Run() {
  std::unique_lock lock(m_mutex);
  for (;;) {
    m_changed.wait(lock, [this] { return m_isEnding || !m_jobs.empty(); });
    if (m_jobs.empty()) return;
    const std::function<void()> job = std::move(m_jobs.front());
    m_jobs.pop_front();
    lock.unlock();
    job();
    lock.lock();
  }
}

}  // namespace qxlink
