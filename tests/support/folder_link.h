// A link to a folder for tests: a junction on Windows; under Wine, which can make none, a symbolic link of the machine
// below it, which Wine shows as a reparse point without a tag. The link, never its target, is gone when the test ends.
#pragma once

#include <windows.h>

#include <cstring>
#include <string>
#include <utility>

#include "core/dynamic_library.h"
#include "core/files.h"
#include "core/scoped.h"

class FolderLink {
 public:
  FolderLink(std::wstring link, const std::wstring& target) : m_link(std::move(link)) {
    if (const std::wstring unixTarget = UnixPath(target); unixTarget.empty()) {
      Run(L"cmd.exe /c mklink /J \"" + m_link + L"\" \"" + target + L"\"");
    } else {
      m_unixLink = UnixPath(m_link);
      Run(L"Z:\\bin\\ln -s \"" + unixTarget + L"\" \"" + m_unixLink + L"\"");
    }
    WaitUntilExists(true);
  }
  ~FolderLink() {
    if (!Exists()) return;
    if (m_unixLink.empty()) {
      RemoveDirectoryW(ExtendedPath(m_link).c_str());
    } else {
      Run(L"Z:\\bin\\rm \"" + m_unixLink + L"\"");
      WaitUntilExists(false);
    }
  }
  FolderLink(const FolderLink&) = delete;
  FolderLink& operator=(const FolderLink&) = delete;

  // False when this system cannot make links; a test is skipped then.
  bool Exists() const { return FolderExists(m_link); }

  // Wine has no way to remove such a link: it follows it.
  bool IsRemovable() const { return m_unixLink.empty(); }

 private:
  static void Run(std::wstring commandLine) {
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

  // A process of the machine below cannot be waited for.
  void WaitUntilExists(bool exists) const {
    for (int i = 0; i < 100 && Exists() != exists; ++i)
      Sleep(20);
  }

  // The path that the machine below Wine uses; empty on Windows.
  static std::wstring UnixPath(const std::wstring& path) {
    using GetUnixFileName = char*(CDECL*)(const wchar_t*);
    const DynamicLibrary kernel(L"kernel32.dll");
    const auto getName = kernel.Resolve<GetUnixFileName>("wine_get_unix_file_name");
    if (getName == nullptr) return {};
    char* const name = getName(path.c_str());  // on the process heap
    if (name == nullptr) return {};
    std::wstring copy(name, name + std::strlen(name));
    HeapFree(GetProcessHeap(), 0, name);
    return copy;
  }

  std::wstring m_link;
  std::wstring m_unixLink;
};
