#include "stutil/product_logging_guard.h"

#include <atomic>
#include <utility>

namespace stutil {
namespace {

// A crashed thread may hold the heap's lock: the crash handler must get its turn nevertheless.
constexpr DWORD kLongestRestore = 2000;  // milliseconds
constexpr DWORD kGccThrow = 0x20474343;  // a C++ exception of that compiler, not yet known to be unhandled

std::atomic<ProductLoggingGuard*> g_guard{nullptr};

}  // namespace

ProductLoggingGuard::ProductLoggingGuard(std::function<void()> restore)
    : m_restore(std::move(restore)),
      m_request(CreateEventW(nullptr, FALSE, FALSE, nullptr)),
      m_done(CreateEventW(nullptr, FALSE, FALSE, nullptr)),
      m_thread(&ProductLoggingGuard::Run, this) {
  g_guard = this;
  // cppcheck-suppress useInitializationList ; nobody may be called before g_guard says whom
  m_previous = SetUnhandledExceptionFilter(&OnUnhandled);
}

ProductLoggingGuard::~ProductLoggingGuard() {
  if (const auto current = SetUnhandledExceptionFilter(m_previous); current != &OnUnhandled) {
    SetUnhandledExceptionFilter(current);  // somebody else's by now, who calls us as the previous one
  }
  g_guard = nullptr;
  SetEvent(m_request.Get());
  m_thread.join();
}

void ProductLoggingGuard::Run() {
  WaitForSingleObject(m_request.Get(), INFINITE);
  m_restore();
  SetEvent(m_done.Get());
}

LONG WINAPI ProductLoggingGuard::OnUnhandled(EXCEPTION_POINTERS* exception) {
  ProductLoggingGuard* const guard = g_guard.load();
  if (guard == nullptr) return EXCEPTION_CONTINUE_SEARCH;
  if (exception->ExceptionRecord->ExceptionCode != kGccThrow) {
    SetEvent(guard->m_request.Get());
    WaitForSingleObject(guard->m_done.Get(), kLongestRestore);
  }
  return guard->m_previous == nullptr ? EXCEPTION_CONTINUE_SEARCH : guard->m_previous(exception);
}

}  // namespace stutil
