#include "core/abandoned_threads.h"

#include <windows.h>

#include <atomic>

namespace {
std::atomic<bool> g_hasAbandonedThreads{false};
}  // namespace

void NoteAbandonedThread() {
  g_hasAbandonedThreads = true;
}

bool HasAbandonedThreads() {
  return g_hasAbandonedThreads;
}

int EndingCode(int code) {
  // Returning from the entry point would run destructors that the thread's code may still use, and then wait for the
  // loader's and the heap's lock, which the thread may hold.
  if (HasAbandonedThreads()) TerminateProcess(GetCurrentProcess(), static_cast<UINT>(code));
  return code;
}
