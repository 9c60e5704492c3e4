// One thread that does one job after the other, in the order in which they were given.
#pragma once

#include <condition_variable>
#include <deque>
#include <functional>
#include <mutex>
#include <thread>

namespace qx {

// Any thread may post. The thread starts with the first job. Ending lets the job under way finish, drops the others and
// waits. A job must not throw.
class BackgroundWorker {
 public:
  static constexpr size_t kMostJobs = 65536;

  BackgroundWorker() = default;
  ~BackgroundWorker();
  BackgroundWorker(const BackgroundWorker&) = delete;
  BackgroundWorker& operator=(const BackgroundWorker&) = delete;

  bool Post(std::function<void()> job);  // false when kMostJobs are waiting, or it is ending

 private:
  void Run();

  std::mutex m_mutex;
  std::condition_variable m_changed;
  std::deque<std::function<void()>> m_jobs;
  bool m_isEnding = false;
  std::thread m_thread;
};

}  // namespace qx
