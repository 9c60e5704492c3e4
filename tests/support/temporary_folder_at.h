// The process's temporary folder is another one while an object lives: what other programs have in the real one does
// not count then.
#pragma once

#include <windows.h>

#include <string>

class TemporaryFolderAt {
 public:
  explicit TemporaryFolderAt(const std::wstring& folder) {
    m_old.resize(GetEnvironmentVariableW(kVariable, m_old.data(), static_cast<DWORD>(m_old.size())));
    SetEnvironmentVariableW(kVariable, folder.c_str());
  }
  ~TemporaryFolderAt() { SetEnvironmentVariableW(kVariable, m_old.c_str()); }
  TemporaryFolderAt(const TemporaryFolderAt&) = delete;
  TemporaryFolderAt& operator=(const TemporaryFolderAt&) = delete;

 private:
  static constexpr wchar_t kVariable[] = L"TMP";  // what the system looks at first

  std::wstring m_old = std::wstring(MAX_PATH + 1, L'\0');
};
