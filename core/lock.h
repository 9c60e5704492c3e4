// A reader-writer lock for std::lock_guard and std::shared_lock that costs nothing to construct and nothing to destroy:
// safe as a global of a library that may be unloaded, and at the end of a process. Not recursive, in either way.
#pragma once

#include <windows.h>

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

  // Gives the lock, held exclusively, up until the condition is signalled; may return without that.
  void Wait(CONDITION_VARIABLE& condition) { SleepConditionVariableSRW(&condition, &m_lock, INFINITE, 0); }

 private:
  SRWLOCK m_lock = SRWLOCK_INIT;
};
