#include "gui/ui_thread.h"

#include <algorithm>
#include <future>
#include <memory>
#include <utility>

#include "core/logging.h"

namespace qx::gui {
namespace {

constexpr wchar_t kScope[] = L"qx::gui::UiThread::Post";

}  // namespace

void UiThread::Attach(HWND window) {
  const std::lock_guard lock(m_mutex);
  m_window = window;
}

void UiThread::Detach() {
  std::list<Work> dropped;  // destroyed outside the lock: what it owns may have destructors of any kind
  const std::lock_guard lock(m_mutex);
  m_window = nullptr;
  dropped.swap(m_posted);
}

HWND UiThread::AttachedWindow() const {
  const std::lock_guard lock(m_mutex);
  return m_window;
}

bool UiThread::Post(UINT message, Work work) {
  std::list<Work> node;
  node.push_back(std::move(work));
  const Work* const address = &node.back();
  HWND window = nullptr;
  {
    const std::lock_guard lock(m_mutex);
    window = m_window;
    if (window == nullptr && message != kCloseMessage) return false;
    m_posted.splice(m_posted.end(), node);
  }
  if (Send(message, address, window)) return true;
  const std::lock_guard lock(m_mutex);
  const auto found = std::find_if(m_posted.begin(), m_posted.end(), [address](const Work& w) { return &w == address; });
  if (found != m_posted.end()) node.splice(node.end(), m_posted, found);
  return false;
}

// A queue takes some 10,000 messages. Other threads wait until the window has caught up; its own cannot.
bool UiThread::Send(UINT message, const Work* work, HWND window) const {
  const auto address = reinterpret_cast<WPARAM>(work);
  for (;;) {
    const BOOL sent = window != nullptr ? PostMessageW(window, message, address, 0)
                                        : PostThreadMessageW(m_thread, message, address, 0);
    if (sent) return true;
    const DWORD error = GetLastError();
    if (error != ERROR_NOT_ENOUGH_QUOTA || IsCurrent()) {
      LOG_ERROR(kScope, L"a message for the window cannot be posted, error %d", error);
      return false;
    }
    if (AttachedWindow() != window) return false;
    Sleep(1);
  }
}

bool UiThread::Call(const Work& work) {
  if (IsCurrent()) {
    if (AttachedWindow() == nullptr) return false;
    work();
    return true;
  }
  // The callable alone owns the promise: when it is dropped unrun, the promise breaks and the wait ends.
  auto task = std::make_shared<std::packaged_task<void()>>(work);
  std::future<void> done = task->get_future();
  if (!Post([task = std::move(task)] { (*task)(); })) return false;
  try {
    done.get();
  } catch (const std::future_error&) {
    return false;
  } catch (...) {  // the work's own failure; it ran
  }
  return true;
}

bool UiThread::Run(UINT message, WPARAM address) {
  if (message != kRunMessage && message != kCloseMessage) return false;
  std::list<Work> work;
  {
    const std::lock_guard lock(m_mutex);
    const auto found = std::find_if(m_posted.begin(), m_posted.end(), [address](const Work& candidate) {
      return reinterpret_cast<WPARAM>(&candidate) == address;
    });
    if (found == m_posted.end()) return false;
    work.splice(work.end(), m_posted, found);
  }
  work.front()();
  return true;
}

}  // namespace qx::gui
