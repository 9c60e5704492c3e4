// The entries of one folder, and the rule which of them are folders of its tree. What the directory walk and the folder
// deletion have in common.
#pragma once

#include <windows.h>

#include <string>
#include <string_view>

#include "core/scoped.h"

inline bool IsAbsence(DWORD error) {
  return error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND;
}

// Calls `visit` (const WIN32_FIND_DATAW& -> bool, false ends) for every entry but "." and "..". `folder` is an
// ExtendedPath that ends in a separator. Returns 0, or why the folder cannot be listed, or not to its end; one that
// vanishes meanwhile just ends. The folder is closed on return.
template <class Visit>
DWORD ForEachEntry(const std::wstring& folder, Visit visit) {
  WIN32_FIND_DATAW entry;
  // Short names are not asked for, and the system hands over the entries in large blocks.
  const FindHandle listing(FindFirstFileExW((folder + L"*").c_str(), FindExInfoBasic, &entry, FindExSearchNameMatch,
                                            nullptr, FIND_FIRST_EX_LARGE_FETCH));
  if (!listing) return GetLastError();
  do {
    const std::wstring_view name = entry.cFileName;
    if (name != L"." && name != L".." && !visit(static_cast<const WIN32_FIND_DATAW&>(entry))) return ERROR_SUCCESS;
  } while (FindNextFileW(listing.Get(), &entry));
  const DWORD error = GetLastError();
  return error == ERROR_NO_MORE_FILES || IsAbsence(error) ? ERROR_SUCCESS : error;
}

inline bool IsFolder(const WIN32_FIND_DATAW& entry) {
  return (entry.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
}

// An entry that stands for a file or folder elsewhere: reading it would read what its maker chose.
inline bool IsLink(const WIN32_FIND_DATAW& entry) {
  return (entry.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0 && IsReparseTagNameSurrogate(entry.dwReserved0);
}

// A folder whose content belongs to the tree. Not so one that stands for a folder elsewhere (a junction, a symbolic
// link, a mounted volume) or does not tell what it is: entering it could leave the tree or never end. Folders of a
// cloud drive are reparse points too, but hold their own content.
inline bool IsFolderOfTree(const WIN32_FIND_DATAW& entry) {
  if (!IsFolder(entry)) return false;
  if ((entry.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) == 0) return true;
  const DWORD tag = entry.dwReserved0;  // only then it is a tag
  return tag != 0 && !IsReparseTagNameSurrogate(tag);
}
