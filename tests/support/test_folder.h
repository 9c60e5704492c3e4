// A folder for the files of one test: empty when the test begins, gone with everything in it when the test ends, also
// when an assertion fails. And the current folder for a while.
#pragma once

#include <windows.h>

#include <atomic>
#include <stdexcept>
#include <string>
#include <string_view>

#include "core/delete_folder.h"
#include "core/files.h"
#include "core/paths.h"

class TestFolder {
 public:
  TestFolder() : m_path(NewPath()) {
    if (!CreateDirectoryW(ExtendedPath(m_path).c_str(), nullptr)) throw std::runtime_error("no folder for the test");
  }
  ~TestFolder() { DeleteFolder(m_path, true); }
  TestFolder(const TestFolder&) = delete;
  TestFolder& operator=(const TestFolder&) = delete;

  const std::wstring& Path() const { return m_path; }  // absolute, without a trailing separator

  // The path of `name`, which may have several components, inside the folder.
  std::wstring Path(std::wstring_view name) const { return std::wstring(JoinPath(m_path, name)); }

  // Makes the subfolder, its parents too, or the file with its parents; returns its path.
  std::wstring MakeFolder(std::wstring_view name) const {
    const std::wstring path = ExtendedPath(Path(name));
    for (size_t end = ExtendedPath(m_path).size(); end != std::wstring::npos;) {
      end = path.find(L'\\', end + 1);
      if (!CreateDirectoryW(path.substr(0, end).c_str(), nullptr) && GetLastError() != ERROR_ALREADY_EXISTS) {
        throw std::runtime_error("a subfolder of the test cannot be made");
      }
    }
    return Path(name);
  }
  std::wstring MakeFile(std::wstring_view name, std::string_view bytes = {}) const {
    if (const size_t end = name.find_last_of(L"\\/"); end != std::wstring_view::npos) MakeFolder(name.substr(0, end));
    if (WriteWholeFile(Path(name), bytes) != ERROR_SUCCESS) {
      throw std::runtime_error("a file of the test cannot be made");
    }
    return Path(name);
  }

 private:
  static std::wstring NewPath() {
    static std::atomic<unsigned> s_count{0};
    wchar_t temporary[MAX_PATH + 1] = {};
    GetTempPathW(MAX_PATH + 1, temporary);
    const std::wstring name = L"st_test_" + std::to_wstring(GetCurrentProcessId()) + L"_" +
                              std::to_wstring(GetTickCount64()) + L"_" + std::to_wstring(++s_count);
    return std::wstring(JoinPath(temporary, name));
  }

  std::wstring m_path;
};

// Makes `path` the current folder of the process until the end of the scope.
class CurrentFolder {
 public:
  explicit CurrentFolder(const std::wstring& path) : m_before(GetCurrentDirectoryW(0, nullptr), L'\0') {
    m_before.resize(GetCurrentDirectoryW(static_cast<DWORD>(m_before.size()), m_before.data()));
    if (!SetCurrentDirectoryW(path.c_str())) throw std::runtime_error("the current folder cannot be changed");
  }
  ~CurrentFolder() { SetCurrentDirectoryW(m_before.c_str()); }
  CurrentFolder(const CurrentFolder&) = delete;
  CurrentFolder& operator=(const CurrentFolder&) = delete;

 private:
  std::wstring m_before;
};
