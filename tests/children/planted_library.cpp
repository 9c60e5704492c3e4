// A library that somebody planted: whoever loads it as code finds "<its path>.loaded" beside it.
#include <windows.h>

#include <cwchar>

BOOL WINAPI DllMain(HINSTANCE self, DWORD reason, void*) {
  wchar_t path[1024] = {};
  constexpr DWORD kRoom = 1000;
  if (reason != DLL_PROCESS_ATTACH || GetModuleFileNameW(self, path, kRoom) >= kRoom) return TRUE;
  std::wcscat(path, L".loaded");
  const HANDLE mark = CreateFileW(path, GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, FILE_ATTRIBUTE_NORMAL, nullptr);
  if (mark != INVALID_HANDLE_VALUE) CloseHandle(mark);
  return TRUE;
}
