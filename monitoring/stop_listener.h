// Everything by which a user or the system may end a monitoring run: the named event below, Ctrl-C or Ctrl-Break in the
// console from which the program was started, closing that console, WM_CLOSE to the program's hidden window (what the
// system's taskkill sends), logging off and shutting down.
#pragma once

#include <windows.h>

#include <functional>
#include <thread>

#include "core/scoped.h"

namespace st::monitoring {

inline constexpr wchar_t kStopEventName[] = L"Local\\QuorvexSupportToolStopMonitoring";

// Listens while it lives; one at a time in a process. `stop` is called on threads of the listener's own or of the
// system, perhaps more than once, and must not throw. When the system itself ends the program, the caller's work has
// until the listener is destroyed, and no longer than about five seconds.
class StopListener {
 public:
  explicit StopListener(std::function<void()> stop, const wchar_t* eventName = kStopEventName);
  ~StopListener();
  StopListener(const StopListener&) = delete;
  StopListener& operator=(const StopListener&) = delete;

 private:
  static BOOL WINAPI OnConsoleEvent(DWORD event);
  static LRESULT CALLBACK OnWindowMessage(HWND window, UINT message, WPARAM wide, LPARAM other);
  void Listen();
  void Stop(const wchar_t* reason) const;
  void WaitUntilDone() const;

  const std::function<void()> m_stop;
  KernelHandle m_stopEvent;  // the named one
  KernelHandle m_done;       // the run is over; set for good
  bool m_ownsConsole = false;
  std::thread m_thread;
};

}  // namespace st::monitoring
