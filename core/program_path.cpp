#include "core/program_path.h"

#include <windows.h>

#include "core/paths.h"

namespace {

std::wstring ModulePath(HMODULE module) {
  constexpr DWORD kLongestPath = 32767;
  std::wstring path(kLongestPath + 1, L'\0');
  path.resize(GetModuleFileNameW(module, path.data(), kLongestPath + 1));
  return path;
}

}  // namespace

std::wstring ProgramPath() {
  return ModulePath(nullptr);
}

std::wstring ProgramFolder() {
  return std::wstring(ParentFolder(ProgramPath()));
}

std::wstring OwnModuleFolder() {
  HMODULE module = nullptr;
  GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                     reinterpret_cast<LPCWSTR>(&OwnModuleFolder), &module);
  return std::wstring(ParentFolder(ModulePath(module)));
}
