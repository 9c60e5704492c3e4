#include "core/walk_dir.h"

#include <string>
#include <utility>
#include <vector>

#include "core/files.h"
#include "core/folder_entries.h"
#include "core/logging.h"
#include "core/paths.h"

bool WalkDir(std::wstring_view root, const WalkDirEntryCallback& callback) {
  if (root.empty()) return false;  // "\*" would be the current drive
  const qx::PathString shownRoot = JoinPath(root, {});
  // Made once; names are appended as they are, because passing a longer path through the system again could change it.
  const std::wstring listedRoot(JoinPath(ExtendedPath(shownRoot), {}));

  std::vector<std::wstring> pending{L""};  // below the root, each ended by a separator
  while (!pending.empty()) {
    const std::wstring folder = std::move(pending.back());
    pending.pop_back();
    qx::PathString path(shownRoot);
    path += folder;
    const size_t folderLength = path.size();
    bool isStopped = false;
    bool isListed = false;
    const DWORD error = ForEachEntry(listedRoot + folder, [&](const WIN32_FIND_DATAW& entry) {
      isListed = true;
      path.resize(folderLength);
      path += entry.cFileName;
      const WalkDir_Ret answer = callback(path, entry);
      isStopped = answer == kWalkStop;
      if (!isStopped && answer != kWalkSkip && IsFolderOfTree(entry)) {
        pending.push_back(folder + entry.cFileName + L'\\');
      }
      return !isStopped;
    });
    if (isStopped) return true;
    if (error == ERROR_SUCCESS) continue;
    const bool isRoot = folder.empty();
    // What vanishes meanwhile, never was there or is a file is no failure.
    const bool isFile = isRoot && !isListed && !FolderExists(shownRoot);
    if (!IsAbsence(error) && !isFile) {
      path.resize(folderLength);
      LOG_WARNING(L"WalkDir", L"%s cannot be listed%s, error %u", path.c_str(), isListed ? L" to its end" : L"", error);
    }
    if (isRoot && !isListed) return false;
  }
  return true;
}

bool WalkDir(std::wstring_view root, const WalkDirAttributesCallback& callback) {
  return WalkDir(root, [&callback](const qx::PathString& path, const WIN32_FIND_DATAW& entry) {
    return callback(path, entry.dwFileAttributes);
  });
}
