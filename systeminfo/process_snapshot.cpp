#include "systeminfo/process_snapshot.h"

#include <psapi.h>

#include <algorithm>

#include "core/logging.h"

namespace systeminfo {
namespace {

constexpr size_t kUsualProcesses = 4096;
constexpr DWORD kLongestPath = 32768;  // the usual 260 characters would cut a path in a deep folder

}  // namespace

void ProcessInfoCache::TakeProceessesSnapshot() {
  std::vector<DWORD> ids(kUsualProcesses);
  for (;;) {
    DWORD bytes = 0;
    const auto size = static_cast<DWORD>(ids.size() * sizeof(DWORD));
    if (!EnumProcesses(ids.data(), size, &bytes)) {
      LOG_TRACE(L"systeminfo::ProcessInfoCache::TakeProceessesSnapshot", L"EnumProcesses failed error code : %d",
                static_cast<int>(GetLastError()));
      return;
    }
    const bool mayBeMore = bytes == size;  // the call does not say
    ids.resize(mayBeMore ? ids.size() * 2 : bytes / sizeof(DWORD));
    if (!mayBeMore) break;
  }
  std::sort(ids.begin(), ids.end());
  for (const DWORD id : ids) {
    KernelHandle process(OpenProcess(PROCESS_ALL_ACCESS, FALSE, id));
    if (!process) {
      LOG_TRACE(L"systeminfo::ProcessInfoCache", L"process %u cannot be opened, error %u", id, GetLastError());
    }
    std::wstring path = GetProcessName(process.Get());
    m_records.push_back({std::move(process), id, std::move(path)});
  }
}

std::wstring ProcessInfoCache::GetProcessName(HANDLE process) {
  constexpr wchar_t kScope[] = L"systeminfo::ProcessInfoCache::GetProcessName";
  if (process == INVALID_HANDLE_VALUE) {
    LOG_TRACE(kScope, L"Invalid process handle");
    return {};
  }
  std::wstring path(kLongestPath, L'\0');
  const DWORD length = GetModuleFileNameExW(process, nullptr, path.data(), kLongestPath);
  if (length == 0) {
    // The name of another call is kept.
    LOG_TRACE(kScope, L"QueryFullProcessImageName failed with error code : %lu", GetLastError());
    return {};
  }
  path.resize(std::min(length, kLongestPath));
  return path;
}

std::wstring ProcessInfoCache::GetProcessDataByPid(uint32_t processId) const {
  // Two snapshots one after another are not sorted as a whole.
  const auto found = std::find_if(m_records.begin(), m_records.end(),
                                  [&](const ProcessRecord& record) { return record.processId == processId; });
  if (found != m_records.end()) return found->imagePath;
  LOG_TRACE(L"systeminfo::ProcessInfoCache::GetProcessDataByPid", L"Could not find valid process data for pid %d",
            static_cast<int>(processId));
  return {};
}

std::vector<std::pair<uint32_t, HANDLE>> ProcessInfoCache::GetProcessesByName(std::wstring_view text) const {
  std::vector<std::pair<uint32_t, HANDLE>> found;
  for (const ProcessRecord& record : m_records) {
    if (!record.imagePath.empty() && record.imagePath.find(text) != std::wstring::npos) {
      found.emplace_back(record.processId, record.process.Get());
    }
  }
  return found;
}

}  // namespace systeminfo
