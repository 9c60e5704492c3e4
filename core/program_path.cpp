#include "core/program_path.h"

#include <windows.h>

#include "core/logging.h"
#include "core/paths.h"

namespace {

constexpr wchar_t kScope[] = L"ModulePath";

std::wstring ModulePath(HMODULE module) {
  constexpr DWORD kLongestPath = 32767;
  std::wstring path(kLongestPath + 1, L'\0');
  path.resize(GetModuleFileNameW(module, path.data(), kLongestPath + 1));
  if (path.empty()) LOG_ERROR(kScope, L"the path of a module is not known, error %u", GetLastError());
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
  if (!GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                          reinterpret_cast<LPCWSTR>(&OwnModuleFolder), &module)) {
    LOG_ERROR(kScope, L"the own module is not known, error %u", GetLastError());
    return {};  // without a module the program's own path would be asked for
  }
  return std::wstring(ParentFolder(ModulePath(module)));
}
