// Holds open what a test looks for in it, and says so on its standard output, one fact in a line, the last one "ready":
//   pid NUMBER            handle VALUE TYPE (open)            closed VALUE            module PATH (in the order of
//   loading)
// Then waits to be ended.
#include <windows.h>

#include <psapi.h>

#include <cstdio>
#include <vector>

#include "core/dynamic_library.h"
#include "core/scoped.h"
#include "core/text.h"

namespace {

void Say(HANDLE handle, const char* type) {
  std::printf("handle %llu %s\n", static_cast<unsigned long long>(reinterpret_cast<uintptr_t>(handle)), type);
}

void SayModules() {
  std::vector<HMODULE> modules(1024);
  DWORD size = 0;
  EnumProcessModules(GetCurrentProcess(), modules.data(), static_cast<DWORD>(modules.size() * sizeof(HMODULE)), &size);
  modules.resize(size / sizeof(HMODULE));
  for (const HMODULE module : modules) {
    wchar_t path[MAX_PATH] = {};
    GetModuleFileNameW(module, path, MAX_PATH);
    std::printf("module %s\n", ToUtf8(path).c_str());
  }
}

}  // namespace

int main() {
  const DynamicLibrary library(L"version.dll");
  wchar_t self[MAX_PATH] = {};
  GetModuleFileNameW(nullptr, self, MAX_PATH);
  const KernelHandle file(CreateFileW(self, GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING, 0, nullptr));
  const KernelHandle event(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  const KernelHandle mutex(CreateMutexW(nullptr, FALSE, nullptr));
  HKEY key = nullptr;
  RegOpenKeyExW(HKEY_CURRENT_USER, L"Software", 0, KEY_READ, &key);
  KernelHandle closed(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  std::printf("pid %lu\n", GetCurrentProcessId());
  Say(file.Get(), "File");
  Say(event.Get(), "Event");
  Say(mutex.Get(), "Mutant");
  Say(key, "Key");
  std::printf("closed %llu\n", static_cast<unsigned long long>(reinterpret_cast<uintptr_t>(closed.Get())));
  closed.Reset();
  SayModules();
  std::printf("ready\n");
  std::fflush(stdout);
  Sleep(INFINITE);
  return 0;
}
