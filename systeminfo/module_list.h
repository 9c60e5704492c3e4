// The modules (executable and libraries) that a process has loaded, 32-bit ones included. One thread at a time.
#pragma once

#include <windows.h>
// windows.h has to come first.
#include <psapi.h>

#include <string>
#include <vector>

#include "core/dynamic_library.h"

namespace systeminfo {

class ModulesHelper {
 public:
  // Binds psapi.dll, or another library with the same entry points. Without EnumProcessModulesEx it makes do with
  // EnumProcessModules; when anything else is missing the helper stays insane and says so.
  explicit ModulesHelper(const wchar_t* library = L"psapi.dll");

  // The full paths, in the order in which they were loaded, the executable first. Empty when the process cannot be
  // opened or ends meanwhile; `modules` is left as it is when the helper is not sane.
  void GetModulesForProcess(DWORD processId, std::vector<std::wstring>& modules) const;

 private:
  bool Enumerate(HANDLE process, std::vector<HMODULE>& modules) const;

  DynamicLibrary m_library;
  bool m_useEx = true;
  bool m_isSane = false;
  decltype(&EnumProcessModules) m_enumModules = nullptr;
  decltype(&EnumProcessModulesEx) m_enumModulesEx = nullptr;
  decltype(&GetModuleFileNameExW) m_getModuleFileName = nullptr;
};

}  // namespace systeminfo
