// Registry keys for tests: a key of the current user that is gone with everything below it when the test ends, and a
// hive that shows such a key instead of the machine's own.
#pragma once

#include <windows.h>

#include <atomic>
#include <stdexcept>
#include <string>
#include <string_view>

#include "core/scoped.h"

class TestRegistryKey {
 public:
  TestRegistryKey() : m_path(NewPath()) { MakeKey({}); }
  ~TestRegistryKey() { RegDeleteTreeW(HKEY_CURRENT_USER, m_path.c_str()); }
  TestRegistryKey(const TestRegistryKey&) = delete;
  TestRegistryKey& operator=(const TestRegistryKey&) = delete;

  std::wstring PathBelowHive() const { return m_path; }     // of HKEY_CURRENT_USER
  std::wstring Path() const { return L"HKCU\\" + m_path; }  // of the key itself
  std::wstring Path(std::wstring_view subkey) const { return Path() + L"\\" + std::wstring(subkey); }

  // Makes the subkey, its parents too. Empty: the key itself.
  RegistryKeyHandle MakeKey(std::wstring_view subkey, DWORD options = 0) const {
    std::wstring path = m_path;
    if (!subkey.empty()) path.append(L"\\").append(subkey);
    RegistryKeyHandle key;
    if (RegCreateKeyExW(HKEY_CURRENT_USER, path.c_str(), 0, nullptr, options, KEY_ALL_ACCESS, nullptr, key.Receive(),
                        nullptr) != ERROR_SUCCESS) {
      throw std::runtime_error("a registry key of the test cannot be made");
    }
    return key;
  }

  // The bytes as they are.
  void SetValue(std::wstring_view subkey, const std::wstring& name, DWORD type, std::string_view data) const {
    if (RegSetValueExW(MakeKey(subkey).Get(), name.c_str(), 0, type, reinterpret_cast<const BYTE*>(data.data()),
                       static_cast<DWORD>(data.size())) != ERROR_SUCCESS) {
      throw std::runtime_error("a registry value of the test cannot be written");
    }
  }
  // A terminated text.
  void SetText(std::wstring_view subkey, const std::wstring& name, const std::wstring& text,
               DWORD type = REG_SZ) const {
    SetValue(subkey, name, type, Bytes(std::wstring_view(text.c_str(), text.size() + 1)));
  }
  void SetNumber(std::wstring_view subkey, const std::wstring& name, DWORD number) const {
    SetValue(subkey, name, REG_DWORD, {reinterpret_cast<const char*>(&number), sizeof number});
  }

  static std::string_view Bytes(std::wstring_view text) {
    return {reinterpret_cast<const char*>(text.data()), text.size() * sizeof(wchar_t)};
  }

 private:
  static std::wstring NewPath() {
    static std::atomic<unsigned> s_count{0};
    return L"Software\\st_test_" + std::to_wstring(GetCurrentProcessId()) + L"_" + std::to_wstring(GetTickCount64()) +
           L"_" + std::to_wstring(++s_count);
  }

  std::wstring m_path;
};

// While it lives, `hive` of this process is `key`.
class RedirectedHive {
 public:
  RedirectedHive(HKEY hive, const RegistryKeyHandle& key) : m_hive(hive) {
    if (RegOverridePredefKey(hive, key.Get()) != ERROR_SUCCESS) throw std::runtime_error("a hive cannot be redirected");
  }
  ~RedirectedHive() { RegOverridePredefKey(m_hive, nullptr); }
  RedirectedHive(const RedirectedHive&) = delete;
  RedirectedHive& operator=(const RedirectedHive&) = delete;

 private:
  HKEY m_hive;
};
