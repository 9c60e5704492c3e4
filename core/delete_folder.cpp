#include "core/delete_folder.h"

#include <windows.h>

#include <string>
#include <utility>
#include <vector>

#include "core/files.h"
#include "core/folder_entries.h"
#include "core/logging.h"
#include "core/paths.h"

namespace {

// Milliseconds: of one pause, and of all pauses of one removal together.
constexpr DWORD kWaitingStep = 10;
constexpr DWORD kMostWaiting = 1000;

using RemoveFunction = BOOL(WINAPI*)(const wchar_t*);

bool Remove(RemoveFunction remove, const std::wstring& path, bool force) {
  if (remove(path.c_str())) return true;
  if (!force || GetLastError() != ERROR_ACCESS_DENIED) return false;
  const DWORD attributes = GetFileAttributesW(path.c_str());
  if (attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_READONLY) != 0) {
    SetFileAttributesW(path.c_str(), attributes & ~static_cast<DWORD>(FILE_ATTRIBUTE_READONLY));
  }
  return remove(path.c_str()) != FALSE;
}

bool IsLink(const std::wstring& path) {
  WIN32_FIND_DATAW entry;
  const FindHandle found(FindFirstFileExW(path.c_str(), FindExInfoBasic, &entry, FindExSearchNameMatch, nullptr, 0));
  return found && IsFolder(entry) && !IsFolderOfTree(entry);
}

// The folders from the top down to the one being emptied, on a list of its own: the call stack does not grow with the
// depth of the tree.
class TreeRemoval {
 public:
  TreeRemoval(std::wstring root, bool force) : m_path(std::move(root)), m_force(force) {}

  bool Run() {
    EnterCurrentFolder();
    while (!m_levels.empty()) {
      Level& level = m_levels.back();
      m_path.resize(level.pathLength);
      if (level.subfolders.empty()) {
        m_isComplete = RemoveEmptied() && m_isComplete;
        m_levels.pop_back();
      } else {
        m_path += L'\\';
        m_path += level.subfolders.back();
        level.subfolders.pop_back();
        EnterCurrentFolder();
      }
    }
    return m_isComplete;
  }

 private:
  struct Level {
    size_t pathLength;
    std::vector<std::wstring> subfolders;  // names, still to be removed
  };

  // What somebody else looks at right now, an indexer or a virus scanner, stands until it lets go, and its folder is
  // not empty so long. That is waited for, but not when something of the tree stays anyway.
  bool RemoveEmptied() {
    for (;;) {
      if (Remove(RemoveDirectoryW, m_path, m_force)) return true;
      const DWORD error = GetLastError();
      const bool isInUse = error == ERROR_DIR_NOT_EMPTY || error == ERROR_SHARING_VIOLATION;
      if (!isInUse || !m_isComplete || m_waited >= kMostWaiting) return false;
      Sleep(kWaitingStep);
      m_waited += kWaitingStep;
    }
  }

  // Removes what is not a subfolder from the folder `m_path`, and notes its subfolders.
  void EnterCurrentFolder() {
    Level level{m_path.size(), {}};
    m_path += L'\\';
    const std::wstring folder = m_path;
    const DWORD error = ForEachEntry(folder, [&](const WIN32_FIND_DATAW& entry) {
      if (IsFolderOfTree(entry)) {
        level.subfolders.emplace_back(entry.cFileName);
      } else {
        m_path.resize(folder.size());
        m_path += entry.cFileName;
        m_isComplete &= Remove(IsFolder(entry) ? RemoveDirectoryW : DeleteFileW, m_path, m_force);
      }
      return true;
    });
    if (error != ERROR_SUCCESS && !IsAbsence(error)) {  // what was not listed keeps its folder from being removed
      LOG_WARNING(L"DeleteFolder", L"%s cannot be listed, error %u", folder.c_str(), error);
    }
    m_levels.push_back(std::move(level));
  }

  std::wstring m_path;
  bool m_force;
  bool m_isComplete = true;
  DWORD m_waited = 0;  // milliseconds, in all
  std::vector<Level> m_levels;
};

}  // namespace

bool DeleteFolder(std::wstring_view folder, bool force) {
  if (folder.empty()) return false;
  std::wstring path = ExtendedPath(JoinPath(folder, {}));  // "C:" is the root too, not the drive's current folder
  if (IsVolumeRoot(path)) return false;
  while (path.ends_with(L'\\'))
    path.pop_back();
  if (IsLink(path)) return Remove(RemoveDirectoryW, path, force);
  return TreeRemoval(std::move(path), force).Run();
}
