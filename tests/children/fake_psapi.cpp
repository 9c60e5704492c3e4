// Stands in for psapi.dll: what an old one exports, for a process with very many modules. Built a second time without
// GetModuleFileNameExW.
#include <windows.h>

namespace {

constexpr DWORD kModules = 1500;

}  // namespace

extern "C" {

__declspec(dllexport) BOOL WINAPI EnumProcessModules(HANDLE, HMODULE* modules, DWORD size, DWORD* needed) {
  *needed = kModules * sizeof(HMODULE);
  for (DWORD i = 0; i < kModules && (i + 1) * sizeof(HMODULE) <= size; ++i)
    modules[i] = reinterpret_cast<HMODULE>(static_cast<ULONG_PTR>(i));
  return TRUE;
}

#ifndef ST_WITHOUT_NAMES
__declspec(dllexport) DWORD WINAPI GetModuleFileNameExW(HANDLE, HMODULE module, LPWSTR name, DWORD size) {
  const auto number = static_cast<DWORD>(reinterpret_cast<ULONG_PTR>(module));
  // One module has no name.
  if (number == 7 || size < 2) return 0;
  name[0] = static_cast<wchar_t>(L'a' + number % 26);
  name[1] = L'\0';
  return 1;
}
#endif
}
