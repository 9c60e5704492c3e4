#include "core/program_path.h"

#include <windows.h>

std::wstring ProgramPath() {
  constexpr DWORD kLongestPath = 32767;
  std::wstring path(kLongestPath + 1, L'\0');
  path.resize(GetModuleFileNameW(nullptr, path.data(), kLongestPath + 1));
  return path;
}

std::wstring ProgramFolder() {
  const std::wstring path = ProgramPath();
  const size_t separator = path.find_last_of(L"\\/");
  return separator == std::wstring::npos ? std::wstring() : path.substr(0, separator);
}
