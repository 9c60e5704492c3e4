// The way from any thread to the one that owns a window: a callable is posted and the window's message loop runs it.
// What was posted is dropped when the window goes, never run later.
#pragma once

#include <windows.h>

#include <functional>
#include <list>
#include <mutex>

namespace qx::gui {

class UiThread {
 public:
  using Work = std::function<void()>;

  // Private window messages; the first parameter is the address of the callable.
  static constexpr UINT kRunMessage = WM_USER + 1;
  static constexpr UINT kCloseMessage = WM_USER + 2;  // the same, for the request to close

  UiThread() : m_thread(GetCurrentThreadId()) {}  // on the thread in question
  UiThread(const UiThread&) = delete;
  UiThread& operator=(const UiThread&) = delete;

  bool IsCurrent() const { return GetCurrentThreadId() == m_thread; }

  // Between the two a window receives what is posted. Detaching drops what has not run, and lets go whoever waits for
  // it.
  void Attach(HWND window);
  void Detach();

  // Any thread. False when there is no window, or its queue stays full.
  bool Post(Work work) { return Post(kRunMessage, std::move(work)); }

  // Without a window it goes to the thread's own queue instead.
  void PostClose(Work work) { Post(kCloseMessage, std::move(work)); }

  // Runs the work on the thread and waits for its end; at once when already there. False, without having run it, when
  // the window is not there or goes meanwhile. What the work throws is lost.
  bool Call(const Work& work);

  // For the window's procedure and the loop: runs what a message carries. False when the message is not one of these,
  // or its parameter is not the address of anything posted here: any process may send such messages.
  bool Run(UINT message, WPARAM address);

 private:
  bool Post(UINT message, Work work);
  bool Send(UINT message, const Work* work, HWND window) const;
  HWND AttachedWindow() const;

  const DWORD m_thread;
  mutable std::mutex m_mutex;
  HWND m_window = nullptr;
  std::list<Work> m_posted;  // a list, because the messages carry addresses
};

}  // namespace qx::gui
