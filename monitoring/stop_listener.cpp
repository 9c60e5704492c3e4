#include "monitoring/stop_listener.h"

#include <mutex>
#include <shared_mutex>
#include <utility>

#include "core/lock.h"
#include "core/logging.h"

namespace st::monitoring {
namespace {

constexpr wchar_t kFunction[] = L"st::monitoring::StopListener";
constexpr wchar_t kWindowClass[] = L"SupportToolMonitoring";
constexpr DWORD kGrace = 5000;  // milliseconds; what the system itself gives

SharedLock g_lock;
StopListener* g_listener = nullptr;  // guarded by g_lock: the handlers come on threads of the system

struct WindowTraits {
  using Type = HWND;
  static bool IsValid(HWND window) { return window != nullptr; }
  static void Close(HWND window) { DestroyWindow(window); }
};
using ScopedWindow = Scoped<WindowTraits>;

}  // namespace

StopListener::StopListener(std::function<void()> stop, const wchar_t* eventName) : m_stop(std::move(stop)) {
  m_done.Reset(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  if (!m_done) LOG_ERROR(kFunction, L"error creating event: %d", GetLastError());
  m_stopEvent.Reset(CreateEventW(nullptr, FALSE, FALSE, eventName));
  if (!m_stopEvent) LOG_ERROR(kFunction, L"error creating event %s: %d", eventName, GetLastError());
  if (m_stopEvent) ResetEvent(m_stopEvent.Get());  // somebody's from before this run does not count
  {
    const std::lock_guard lock(g_lock);
    g_listener = this;
  }
  // A windowed program has no console of its own. Without one there is no Ctrl-C either.
  m_ownsConsole = AttachConsole(ATTACH_PARENT_PROCESS) != FALSE;
  if (!SetConsoleCtrlHandler(&OnConsoleEvent, TRUE)) {
    LOG_WARNING(kFunction, L"Ctrl-C will not be heard: %d", GetLastError());
  }
  m_thread = std::thread([this] { Listen(); });
}

StopListener::~StopListener() {
  SetEvent(m_done.Get());
  m_thread.join();
  if (!SetConsoleCtrlHandler(&OnConsoleEvent, FALSE)) {
    LOG_WARNING(kFunction, L"the console's events are still heard: %d", GetLastError());
  }
  const std::lock_guard lock(g_lock);  // waits for a console event that is being handled
  g_listener = nullptr;
  if (m_ownsConsole) FreeConsole();
}

BOOL WINAPI StopListener::OnConsoleEvent(DWORD event) {
  const std::shared_lock lock(g_lock);
  if (g_listener == nullptr) return FALSE;
  const bool endsProgram = event != CTRL_C_EVENT && event != CTRL_BREAK_EVENT;
  g_listener->Stop(endsProgram ? L"the console is closed or the session ends" : L"Ctrl-C");
  if (endsProgram) g_listener->WaitUntilDone();  // the system ends the process when this returns
  return TRUE;
}

LRESULT CALLBACK StopListener::OnWindowMessage(HWND window, UINT message, WPARAM wide, LPARAM other) {
  const auto* const listener = reinterpret_cast<const StopListener*>(GetWindowLongPtrW(window, GWLP_USERDATA));
  if (listener != nullptr && message == WM_CLOSE) {
    listener->Stop(L"the program is asked to close");
    return 0;  // the window stays until the run is over
  }
  if (listener != nullptr && message == WM_ENDSESSION && wide != FALSE) {
    listener->Stop(L"the session ends");
    listener->WaitUntilDone();  // the system ends the process when this returns
    return 0;
  }
  return DefWindowProcW(window, message, wide, other);
}

// The listener's own thread: the named event, and the messages of a window that is never shown.
void StopListener::Listen() {
  WNDCLASSW windowClass{};
  windowClass.lpfnWndProc = &OnWindowMessage;
  windowClass.hInstance = GetModuleHandleW(nullptr);
  windowClass.lpszClassName = kWindowClass;
  if (RegisterClassW(&windowClass) == 0 && GetLastError() != ERROR_CLASS_ALREADY_EXISTS) {
    LOG_WARNING(kFunction, L"no window class: %d", GetLastError());
  }
  // A top-level window: message-only ones hear nothing of the session's end.
  const ScopedWindow window(
      CreateWindowExW(0, kWindowClass, L"", WS_POPUP, 0, 0, 0, 0, nullptr, nullptr, windowClass.hInstance, nullptr));
  if (window) {
    SetWindowLongPtrW(window.Get(), GWLP_USERDATA, reinterpret_cast<LONG_PTR>(this));
  } else {
    LOG_WARNING(kFunction, L"no window that would hear of the session's end: %d", GetLastError());
  }

  // Without the named event only the first handle is waited for.
  const HANDLE handles[] = {m_done.Get(), m_stopEvent.Get()};
  const DWORD count = m_stopEvent ? 2 : 1;
  for (;;) {
    const DWORD result = MsgWaitForMultipleObjects(count, handles, FALSE, INFINITE, QS_ALLINPUT);
    if (result == WAIT_OBJECT_0 || result == WAIT_FAILED) return;
    if (count == 2 && result == WAIT_OBJECT_0 + 1) {
      ResetEvent(m_stopEvent.Get());  // it may be somebody's who made it another kind of event
      Stop(L"the stop event is signaled");
    }
    MSG message;
    while (PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE))
      DispatchMessageW(&message);
  }
}

void StopListener::Stop(const wchar_t* reason) const {
  LOG_INFO(kFunction, L"monitoring is to end: %s", reason);
  m_stop();
}

void StopListener::WaitUntilDone() const {
  WaitForSingleObject(m_done.Get(), kGrace);
}

}  // namespace st::monitoring
