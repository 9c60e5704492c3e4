// hanging_child loader | statics | none
// Leaves a thread behind that holds the loader's lock, or that goes on using a static object, and ends with the code 7.
#include <windows.h>

#include <atomic>
#include <cstdio>
#include <cwchar>
#include <thread>
#include <vector>

#include "core/abandoned_threads.h"

namespace {

struct Statics {
  std::vector<int> numbers = std::vector<int>(1000, 1);
  ~Statics() {
    std::puts("static objects are destroyed");
    std::fflush(stdout);
    numbers = {};
    Sleep(200);  // time enough for whoever still uses them
  }
};
Statics g_statics;

void HoldLoader(std::atomic<bool>& isHanging) {
  using Lock = LONG(NTAPI*)(ULONG flags, ULONG * disposition, ULONG_PTR * cookie);
  const auto lock = reinterpret_cast<Lock>(
      reinterpret_cast<void*>(GetProcAddress(GetModuleHandleW(L"ntdll.dll"), "LdrLockLoaderLock")));
  ULONG_PTR cookie = 0;
  lock(0, nullptr, &cookie);
  isHanging = true;
  Sleep(INFINITE);
}

void UseStatics(std::atomic<bool>& isHanging) {
  for (isHanging = true;; Sleep(1)) {
    if (g_statics.numbers.at(500) != 1) std::puts("overwritten");
  }
}

}  // namespace

int wmain(int count, wchar_t** arguments) {
  const wchar_t* const what = count == 2 ? arguments[1] : L"";
  if (std::wcscmp(what, L"none") == 0) return EndingCode(7);
  std::atomic<bool> isHanging{false};
  std::thread(std::wcscmp(what, L"loader") == 0 ? &HoldLoader : &UseStatics, std::ref(isHanging)).detach();
  while (!isHanging)
    Sleep(1);
  NoteAbandonedThread();
  std::puts("hanging");
  std::fflush(stdout);
  return EndingCode(7);
}
