#include "companions/crash/dump_folder.h"

#include <vector>

#include "companions/crash/dump_name.h"
#include "core/files.h"
#include "core/folder_entries.h"

namespace crash {
namespace {

uint64_t Ticks(const FILETIME& time) {
  return uint64_t{time.dwHighDateTime} << 32 | time.dwLowDateTime;
}

DWORD MakeFolder(const std::wstring& folder) {
  if (FolderExists(folder)) return ERROR_SUCCESS;
  if (const DWORD error = CreateFolders(folder.substr(0, folder.find_last_of(L'\\'))); error != ERROR_SUCCESS) {
    return error;
  }
  const DWORD error = CreatePrivateFolder(folder);
  return error == ERROR_ALREADY_EXISTS && FolderExists(folder) ? ERROR_SUCCESS : error;
}

}  // namespace

PreparedFolder PrepareFolder(const std::wstring& folder, uint32_t keep) {
  PreparedFolder prepared;
  prepared.error = MakeFolder(folder);
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
