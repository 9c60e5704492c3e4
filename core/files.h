// Whole files, and paths as the system's file functions need them. Nothing here logs; a function returns 0 or the
// Windows error number of what failed.
#pragma once

#include <windows.h>

#include <cstdint>
#include <string>
#include <string_view>

#include "core/scoped.h"

// The form of a path that has no length limit and keeps trailing dots and spaces: absolute, with the prefix \\?\ (or
// \\?\UNC\). Relative paths are resolved against the current directory, "." and ".." are removed, and "/" becomes "\".
// Every function of this program that opens, lists or deletes by a path passes it through here. An empty path stays
// empty, and a relative one as it is when the system does not name the current directory.
std::wstring ExtendedPath(std::wstring_view path);

// The same without asking the system; `currentDirectory` is absolute.
std::wstring ExtendPath(std::wstring_view path, std::wstring_view currentDirectory);

// An extended path as people and other programs write it: without the prefix. Other paths stay as they are.
std::wstring ShownPath(std::wstring_view extendedPath);

// Where the system says that an open file or folder is, as an extended path; empty when it does not say it.
std::wstring FinalPath(HANDLE file);

bool PathExists(std::wstring_view path);    // a file or a folder
bool FolderExists(std::wstring_view path);  // a folder
// The system says that there is nothing; PathExists is false, too, when it does not say what there is.
bool IsAbsent(std::wstring_view path);

// Opens an existing file for reading it from the beginning, and lets others do with it what they like meanwhile:
// neither who writes a log nor who replaces a settings file by renaming is disturbed. Invalid, with GetLastError set,
// on failure.
KernelHandle OpenForReading(std::wstring_view path);

// Replaces `bytes` by the next `count` bytes of the file, or as many as it has.
DWORD ReadBytes(HANDLE file, size_t count, std::string& bytes);

// Reads a whole file into `bytes`. ERROR_FILE_TOO_LARGE when it is longer than `limit`; nothing is read then.
DWORD ReadWholeFile(std::wstring_view path, uint64_t limit, std::string& bytes);

// Who may do what with a new file.
enum class FileRights {
  kInherited,  // what the folder gives
  kPrivate,    // only the current user, the administrators and the system
};

// Writes a whole file, replacing an older one. The bytes go to "<path>.partial", are flushed to the disk and renamed,
// so that whatever happens no half-written file ever stands under `path`. A link under either name is replaced itself.
DWORD WriteWholeFile(std::wstring_view path, std::string_view bytes, FileRights rights = FileRights::kInherited);

inline constexpr wchar_t kPartialSuffix[] = L".partial";

// The same for a file that is written piece by piece: it stands under `path` only when Publish has succeeded. What was
// not published is deleted with its owner.
class PartialFile {
 public:
  explicit PartialFile(std::wstring_view path, FileRights rights = FileRights::kInherited)
      : m_path(ExtendedPath(path)), m_rights(rights) {}
  ~PartialFile();
  PartialFile(const PartialFile&) = delete;
  PartialFile& operator=(const PartialFile&) = delete;

  DWORD Create();                                 // first
  HANDLE Handle() const { return m_file.Get(); }  // open for reading and writing, for who writes by a handle
  DWORD Write(std::string_view bytes);
  DWORD Flush();    // what was written so far, so that Publish has less to wait for
  DWORD Publish();  // last; flushes to the disk, closes and renames

 private:
  const std::wstring m_path;  // extended
  const FileRights m_rights;
  KernelHandle m_file;
  bool m_isCreated = false;
};

// Makes a finished "<path>.partial" the file `path`, replacing an older one. On failure the partial file stays.
DWORD PublishPartialFile(std::wstring_view path);

// Makes a folder and those of its parents that are missing, with the rights they inherit. One that is there is fine.
DWORD CreateFolders(std::wstring_view path);

// Replaces each %NAME% by the environment variable of that name; one that is not set stays as it is.
std::wstring ExpandEnvironment(std::wstring_view text);
