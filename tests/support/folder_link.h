// A link to a folder for tests: a junction on Windows; under Wine, which can make none, a symbolic link of the machine
// below it, which Wine shows as a reparse point without a tag.
#pragma once

#include <windows.h>

#include <string>

#include "core/dynamic_library.h"
#include "core/files.h"
#include "core/scoped.h"

namespace folder_link {

inline void RunAndWait(std::wstring commandLine) {
  STARTUPINFOW startup{};
  startup.cb = sizeof startup;
  PROCESS_INFORMATION information{};
  if (!CreateProcessW(nullptr, commandLine.data(), nullptr, nullptr, FALSE, CREATE_NO_WINDOW, nullptr, nullptr,
                      &startup, &information)) {
    return;
  }
  const KernelHandle process(information.hProcess);
  const KernelHandle thread(information.hThread);
  WaitForSingleObject(process.Get(), 10'000);
}

// The path that the machine below Wine uses; empty on Windows.
inline std::wstring UnixPath(const std::wstring& path) {
  using GetUnixFileName = char*(CDECL*)(const wchar_t*);
  const DynamicLibrary kernel(L"kernel32.dll");
  const auto getName = kernel.Resolve<GetUnixFileName>("wine_get_unix_file_name");
  if (getName == nullptr) return {};
  char* const name = getName(path.c_str());  // on the process heap
  if (name == nullptr) return {};
  const std::wstring copy(name, name + strlen(name));
  HeapFree(GetProcessHeap(), 0, name);
  return copy;
}

// False when this system cannot make links; a test is skipped then.
inline bool Make(const std::wstring& link, const std::wstring& target) {
  if (const std::wstring unixTarget = UnixPath(target); unixTarget.empty()) {
    RunAndWait(L"cmd.exe /c mklink /J \"" + link + L"\" \"" + target + L"\"");
  } else {
    RunAndWait(L"Z:\\bin\\ln -s \"" + unixTarget + L"\" \"" + UnixPath(link) + L"\"");
    for (int i = 0; i < 100 && !FolderExists(link); ++i)
      Sleep(20);  // such a process cannot be waited for
  }
  return FolderExists(link);
}

}  // namespace folder_link
