#include "systeminfo/module_list.h"

#include <algorithm>

#include "core/logging.h"

namespace systeminfo {
namespace {

constexpr wchar_t kConstructor[] = L"systeminfo::ModulesHelper::ModulesHelper";
constexpr wchar_t kGetModules[] = L"systeminfo::ModulesHelper::GetModulesForProcess";
constexpr size_t kUsualModules = 1024;
constexpr size_t kMostModules = size_t{1} << 16;
constexpr DWORD kLongestPath = 32768;  // the usual 260 characters would cut the path of a module in a deep folder

}  // namespace

ModulesHelper::ModulesHelper(const wchar_t* library) : m_library(library) {
  if (!m_library) {
    LOG_TRACE(kConstructor, L"Can't load psapi.dll");
    return;
  }
  m_enumModulesEx = m_library.Resolve<decltype(m_enumModulesEx)>("EnumProcessModulesEx");
  if (m_enumModulesEx == nullptr) {
    m_useEx = false;
    m_enumModules = m_library.Resolve<decltype(m_enumModules)>("EnumProcessModules");
    if (m_enumModules == nullptr) {
      LOG_TRACE(kConstructor, L"GetProcAddress(EnumProcessModules)");
      return;
    }
  }
  m_getModuleFileName = m_library.Resolve<decltype(m_getModuleFileName)>("GetModuleFileNameExW");
  if (m_getModuleFileName == nullptr) {
    LOG_TRACE(kConstructor, L"GetProcAddress(GetModuleFileNameExW)");
    return;
  }
  m_isSane = true;
}

// A process may load more while it is asked, so a larger buffer can be too small again.
bool ModulesHelper::Enumerate(HANDLE process, std::vector<HMODULE>& modules) const {
  for (size_t room = kUsualModules;;) {
    modules.resize(room);
    const auto size = static_cast<DWORD>(room * sizeof(HMODULE));
    DWORD needed = 0;
    const BOOL isDone = m_useEx ? m_enumModulesEx(process, modules.data(), size, &needed, LIST_MODULES_ALL)
                                : m_enumModules(process, modules.data(), size, &needed);
    if (!isDone) return false;
    const size_t count = needed / sizeof(HMODULE);
    if (count <= room || room == kMostModules) {
      modules.resize(std::min(count, room));
      return true;
    }
    room = std::min(count, kMostModules);
  }
}

void ModulesHelper::GetModulesForProcess(DWORD processId, std::vector<std::wstring>& modules) const {
  if (!m_isSane) {
    LOG_TRACE(kGetModules, L"this class is not in a sane state");
    return;
  }
  modules.clear();
  const KernelHandle process(OpenProcess(PROCESS_QUERY_INFORMATION | PROCESS_VM_READ, FALSE, processId));
  if (!process) {
    LOG_TRACE(kGetModules, L"process %u cannot be opened, error %u", processId, GetLastError());
    return;
  }
  std::vector<HMODULE> handles;
  if (!Enumerate(process.Get(), handles)) {
    LOG_TRACE(kGetModules, L"the modules of process %u cannot be listed, error %u", processId, GetLastError());
    return;
  }
  std::wstring path(kLongestPath, L'\0');
  for (const HMODULE module : handles) {
    const DWORD length = m_getModuleFileName(process.Get(), module, path.data(), kLongestPath);
    if (length != 0) modules.emplace_back(path.data(), std::min(length, kLongestPath));
  }
}

}  // namespace systeminfo
