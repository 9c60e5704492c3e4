// A reader-writer lock for std::lock_guard and std::shared_lock that costs nothing to construct and nothing to destroy:
// safe as a global of a library that may be unloaded, and at the end of a process. Not recursive, in either way. And a
// condition to wait for with it. Objects that come and go have these and not the standard's: of some toolchains' own
// std::mutex an event stays open for each one that two threads have contended for.
#pragma once

#include <windows.h>

#include <chrono>
#include <mutex>

class SharedLock {
 public:
  SharedLock() = default;
  SharedLock(const SharedLock&) = delete;
  SharedLock& operator=(const SharedLock&) = delete;

  // The names that the standard's guards call.
  void lock() { AcquireSRWLockExclusive(&m_lock); }
  void unlock() { ReleaseSRWLockExclusive(&m_lock); }
  void lock_shared() { AcquireSRWLockShared(&m_lock); }
  void unlock_shared() { ReleaseSRWLockShared(&m_lock); }

  // Gives the lock, held exclusively, up until the condition is signalled or the time is over; may return without that.
  void Wait(CONDITION_VARIABLE& condition, DWORD milliseconds = INFINITE) {
    SleepConditionVariableSRW(&condition, &m_lock, milliseconds, 0);
  }

 private:
  SRWLOCK m_lock = SRWLOCK_INIT;
};

// With the names and the meaning of std::condition_variable.
class Condition {
 public:
  Condition() = default;
  Condition(const Condition&) = delete;
  Condition& operator=(const Condition&) = delete;

  void notify_one() { WakeConditionVariable(&m_condition); }
  void notify_all() { WakeAllConditionVariable(&m_condition); }

  template <class Predicate>
  void wait(std::unique_lock<SharedLock>& lock, Predicate isFulfilled) {
    while (!isFulfilled())
      lock.mutex()->Wait(m_condition);
  }

  // False when the time is over and the predicate still false.
  template <class Predicate>
  bool wait_for(std::unique_lock<SharedLock>& lock, std::chrono::milliseconds limit, Predicate isFulfilled) {
    const auto deadline = std::chrono::steady_clock::now() + limit;
    while (!isFulfilled()) {
      const auto left = std::chrono::ceil<std::chrono::milliseconds>(deadline - std::chrono::steady_clock::now());
      if (left <= std::chrono::milliseconds::zero()) return false;
      lock.mutex()->Wait(m_condition, static_cast<DWORD>(left.count()));
    }
    return true;
  }

 private:
  CONDITION_VARIABLE m_condition = CONDITION_VARIABLE_INIT;
};
