#include "monitoring/process_info_cache.h"

#include <psapi.h>

#include <algorithm>
#include <utility>

#include "core/logging.h"

namespace st::monitoring {

bool ProcessInfoCache::TakeProceessesSnapshot() {
  m_records.clear();
  DWORD ids[4096];
  DWORD bytes = 0;
  if (!EnumProcesses(ids, sizeof ids, &bytes)) {
    LOG_ERROR(L"st::monitoring::ProcessInfoCache::TakeProceessesSnapshot", L"EnumProcesses failed error code : %d",
              GetLastError());
    return false;
  }
  const size_t count = std::min<size_t>(bytes, sizeof ids) / sizeof(DWORD);
  for (size_t i = 0; i < count; ++i) {
    KernelHandle handle(OpenProcess(PROCESS_ALL_ACCESS, FALSE, ids[i]));
    std::wstring name = GetProcessName(handle.Get());
    if (handle) m_records.push_back({ids[i], std::move(handle), std::move(name)});
  }
  return true;
}

const ProcessRecord* ProcessInfoCache::GetProcessDataByPid(DWORD id) const {
  const auto found =
      std::find_if(m_records.begin(), m_records.end(), [id](const ProcessRecord& record) { return record.id == id; });
  return found == m_records.end() ? nullptr : &*found;
}

std::vector<const ProcessRecord*> ProcessInfoCache::GetProcessesByName(std::wstring_view text) const {
  std::vector<const ProcessRecord*> found;
  for (const ProcessRecord& record : m_records) {
    if (!record.name.empty() && record.name.find(text) != std::wstring::npos) found.push_back(&record);
  }
  return found;
}

std::wstring ProcessInfoCache::GetProcessName(HANDLE process) {
  constexpr wchar_t kFunction[] = L"st::monitoring::ProcessInfoCache::GetProcessName";
  if (process == nullptr) {
    LOG_TRACE(kFunction, L"Invalid process handle");
    return {};
  }
  std::wstring name(32767, L'\0');
  const DWORD length = GetModuleFileNameExW(process, nullptr, name.data(), static_cast<DWORD>(name.size()));
  if (length == 0) LOG_TRACE(kFunction, L"QueryFullProcessImageName failed with error code : %lu", GetLastError());
  name.resize(length);
  name.shrink_to_fit();  // one for each process is kept
  return name;
}

}  // namespace st::monitoring
