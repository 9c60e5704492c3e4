#include "companions/crash/dump_folder.h"

#include <vector>

#include "companions/crash/dump_name.h"
#include "core/folder_entries.h"
#include "core/private_access.h"

namespace crash {
namespace {

uint64_t Ticks(const FILETIME& time) {
  return uint64_t{time.dwHighDateTime} << 32 | time.dwLowDateTime;
}

}  // namespace

PreparedFolder PrepareFolder(const std::wstring& folder, uint32_t keep) {
  PreparedFolder prepared;
  prepared.error = CreatePrivateFolders(folder);
  if (prepared.error != ERROR_SUCCESS) return prepared;

  const std::wstring start = folder + L"\\";
  std::vector<std::wstring> unfinished;
  std::vector<DumpFile> dumps;
  prepared.error = ForEachEntry(start, [&](const WIN32_FIND_DATAW& entry) {
    if (IsFolder(entry)) return true;
    if (IsPartialDumpName(entry.cFileName)) unfinished.emplace_back(entry.cFileName);
    if (IsDumpName(entry.cFileName)) dumps.push_back({entry.cFileName, Ticks(entry.ftLastWriteTime)});
    return true;
  });
  for (const std::wstring& name : unfinished)
    DeleteFileW((start + name).c_str());
  SortByAge(dumps);
  const size_t tooMany = dumps.size() > keep ? dumps.size() - keep : 0;
  for (size_t i = 0; i < tooMany; ++i)
    DeleteFileW((start + dumps[i].name).c_str());
  if (dumps.size() >= keep && !dumps.empty()) prepared.surplus = start + dumps[tooMany].name;
  return prepared;
}

}  // namespace crash
