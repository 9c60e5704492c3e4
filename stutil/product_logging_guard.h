// While it lives, a crash of this process puts the product's logging back before the crash handler takes over; and its
// end does so in any case. What a kill leaves raised is found by the next start.
#pragma once

#include <windows.h>

#include <functional>
#include <thread>

#include "core/scoped.h"

namespace stutil {

// One at a time in a process; made and destroyed by the same thread, after the crash handler was installed.
class ProductLoggingGuard {
 public:
  // `restore` puts the logging back, or does nothing when nothing is raised; it may be called more than once, on any
  // thread, and must not throw.
  explicit ProductLoggingGuard(std::function<void()> restore);
  ~ProductLoggingGuard();
  ProductLoggingGuard(const ProductLoggingGuard&) = delete;
  ProductLoggingGuard& operator=(const ProductLoggingGuard&) = delete;

 private:
  static LONG WINAPI OnUnhandled(EXCEPTION_POINTERS* exception);
  void Run();

  const std::function<void()> m_restore;
  const KernelHandle m_request;  // to restore now
  const KernelHandle m_done;
  LPTOP_LEVEL_EXCEPTION_FILTER m_previous = nullptr;
  std::thread m_thread;  // a crashed thread's stack and state are not to be relied on
};

}  // namespace stutil
