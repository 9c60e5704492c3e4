#include "core/program_path.h"

#include <windows.h>

namespace {

std::wstring ModulePath(HMODULE module) {
  constexpr DWORD kLongestPath = 32767;
  std::wstring path(kLongestPath + 1, L'\0');
  path.resize(GetModuleFileNameW(module, path.data(), kLongestPath + 1));
  return path;
}

std::wstring FolderOf(const std::wstring& path) {
  const size_t separator = path.find_last_of(L"\\/");
  return separator == std::wstring::npos ? std::wstring() : path.substr(0, separator);
}

}  // namespace

std::wstring ProgramPath() {
  return ModulePath(nullptr);
}

std::wstring ProgramFolder() {
  return FolderOf(ProgramPath());
}

std::wstring OwnModuleFolder() {
  HMODULE module = nullptr;
  GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                     reinterpret_cast<LPCWSTR>(&OwnModuleFolder), &module);
  return FolderOf(ModulePath(module));
}
