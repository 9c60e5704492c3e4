#include "report/extraction.h"

#include <algorithm>

#include "core/files.h"
#include "core/folder_entries.h"
#include "core/paths.h"
#include "core/private_access.h"
#include "core/text.h"
#include "report/entry_name.h"

namespace report {
namespace {

// Empty, or why the entry was not written.
std::string WriteEntry(const Archive& archive, const ArchiveEntry& entry, std::wstring_view folder) {
  const std::wstring path = EntryPath(folder, entry.name);
  const bool isFolder = entry.name.ends_with('/');
  const std::wstring parent = isFolder ? path : path.substr(0, path.find_last_of(L'\\'));
  if (const DWORD error = CreateFolders(parent); error != ERROR_SUCCESS) {
    return "its folder cannot be made, error " + std::to_string(error);
  }
  if (isFolder) return {};
  // The file system knows equal names that EntryNameKey does not.
  if (PathExists(path) || PathExists(path + kPartialSuffix)) return "another entry has the name";
  std::string bytes;
  std::string fault;
  if (!archive.Read(entry, bytes, fault)) return fault;
  const DWORD error = WriteWholeFile(path, bytes);
  return error == ERROR_SUCCESS ? std::string() : "cannot be written, error " + std::to_string(error);
}

}  // namespace

std::string PrepareFolder(const std::wstring& folder) {
  const std::wstring path = ExtendedPath(WithoutEndSeparators(folder));
  if (const DWORD error = CreatePrivateFolders(path); error != ERROR_SUCCESS) {
    return ToUtf8(folder) + " cannot be made, error " + std::to_string(error) + ".";
  }
  bool isEmpty = true;
  const DWORD error = ForEachEntry(path + L"\\", [&](const WIN32_FIND_DATAW&) {
    isEmpty = false;
    return false;
  });
  if (error != ERROR_SUCCESS && error != ERROR_FILE_NOT_FOUND) {
    return ToUtf8(folder) + " cannot be listed, error " + std::to_string(error) + ".";
  }
  return isEmpty ? std::string() : ToUtf8(folder) + " is not empty. Name a folder that is new or empty.";
}

std::vector<Evidence> ExtractArchive(const Archive& archive, std::wstring_view folder) {
  // A file comes before "<file>.partial", under which it is written.
  std::vector<ArchiveEntry> entries = archive.Entries();
  std::sort(entries.begin(), entries.end(),
            [](const ArchiveEntry& a, const ArchiveEntry& b) { return EntryNameKey(a.name) < EntryNameKey(b.name); });
  std::vector<Evidence> failures;
  for (const ArchiveEntry& entry : entries) {
    std::string fault = WriteEntry(archive, entry, folder);
    if (!fault.empty()) failures.push_back({entry.name, "", std::move(fault)});
  }
  return failures;
}

}  // namespace report
