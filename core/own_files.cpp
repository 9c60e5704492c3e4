#include "core/own_files.h"

namespace {

// Whether the open file is what its name says, and no other name leads to it.
DWORD CheckIsOnlyFile(HANDLE file) {
  BY_HANDLE_FILE_INFORMATION info{};
  FILE_ATTRIBUTE_TAG_INFO tag{};
  if (!GetFileInformationByHandle(file, &info)) return GetLastError();
  if ((info.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0) {
    if (!GetFileInformationByHandleEx(file, FileAttributeTagInfo, &tag, sizeof tag)) return GetLastError();
    if (IsReparseTagNameSurrogate(tag.ReparseTag)) return ERROR_CANT_ACCESS_FILE;
  }
  return info.nNumberOfLinks > 1 ? ERROR_TOO_MANY_LINKS : ERROR_SUCCESS;
}

DWORD CopyAll(HANDLE source, HANDLE target) {
  for (;;) {
    char buffer[64 * 1024];
    DWORD read = 0;
    DWORD written = 0;
    if (!ReadFile(source, buffer, sizeof buffer, &read, nullptr)) return GetLastError();
    if (read == 0) return ERROR_SUCCESS;
    if (!WriteFile(target, buffer, read, &written, nullptr)) return GetLastError();
    if (written != read) return ERROR_DISK_FULL;
  }
}

}  // namespace

KernelHandle CreateFreshFile(const wchar_t* path, DWORD access, DWORD share, SECURITY_ATTRIBUTES* security) {
  // Without the flag a link to a name that is free would create that file.
  constexpr DWORD kFlags = FILE_ATTRIBUTE_NORMAL | FILE_FLAG_OPEN_REPARSE_POINT;
  KernelHandle file(CreateFileW(path, access, share, security, CREATE_NEW, kFlags, nullptr));
  if (file || GetLastError() != ERROR_FILE_EXISTS || !DeleteFileW(path)) return file;
  file.Reset(CreateFileW(path, access, share, security, CREATE_NEW, kFlags, nullptr));
  return file;
}

KernelHandle OpenForAppending(const wchar_t* path, DWORD share) {
  // Without FILE_WRITE_DATA every write goes to the end.
  constexpr DWORD kAccess = FILE_APPEND_DATA | FILE_READ_DATA | FILE_READ_ATTRIBUTES | SYNCHRONIZE;
  KernelHandle file(CreateFileW(path, kAccess, share, nullptr, OPEN_ALWAYS,
                                FILE_ATTRIBUTE_NORMAL | FILE_FLAG_OPEN_REPARSE_POINT, nullptr));
  if (!file) return file;
  const DWORD error = CheckIsOnlyFile(file.Get());
  if (error != ERROR_SUCCESS) {
    file.Reset();
    SetLastError(error);
  }
  return file;
}

DWORD CopyToFreshFile(const wchar_t* source, const wchar_t* target) {
  const KernelHandle from(CreateFileW(source, GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE,
                                      nullptr, OPEN_EXISTING, FILE_FLAG_SEQUENTIAL_SCAN, nullptr));
  if (!from) return GetLastError();
  KernelHandle to = CreateFreshFile(target, GENERIC_WRITE, 0);
  if (!to) return GetLastError();
  const DWORD error = CopyAll(from.Get(), to.Get());
  to.Reset();
  if (error != ERROR_SUCCESS) DeleteFileW(target);
  return error;
}
