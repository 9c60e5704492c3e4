// One thread that does jobs one after another, in the order in which they were given. It begins with the first.
#pragma once

#include <deque>
#include <functional>
#include <thread>

#include "core/lock.h"

namespace qxlink {

class Worker {
 public:
  Worker() = default;
  ~Worker();  // after all jobs that were given
  Worker(const Worker&) = delete;
  Worker& operator=(const Worker&) = delete;

  // `job` must not throw. Throws when there is no memory or no thread for it; it is not done then.
  void Give(std::function<void()> job);

 private:
  void Run();

  SharedLock m_mutex;
  Condition m_changed;
  std::deque<std::function<void()>> m_jobs;  // guarded by m_mutex
  bool m_isEnding = false;                   // guarded by m_mutex
  std::thread m_thread;
};

}  // namespace qxlink
