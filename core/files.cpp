#include "core/files.h"

#include <algorithm>
#include <vector>

#include "core/own_files.h"
#include "core/private_access.h"

namespace {

constexpr std::wstring_view kLocalPrefix = L"\\\\?\\";
constexpr std::wstring_view kNetworkPrefix = L"\\\\?\\UNC\\";

bool IsDriveAbsolute(std::wstring_view path) {
  return path.size() >= 3 && path[1] == L':' && path[2] == L'\\';
}

// Removes "." and "..", and doubled separators, from what follows the first `rootLength` characters.
std::wstring WithoutDots(std::wstring_view path, size_t rootLength) {
  std::vector<std::wstring_view> parts;
  for (size_t begin = rootLength; begin < path.size();) {
    const size_t end = std::min(path.find(L'\\', begin), path.size());
    const std::wstring_view part = path.substr(begin, end - begin);
    if (part == L"..") {
      if (!parts.empty()) parts.pop_back();
    } else if (!part.empty() && part != L".") {
      parts.push_back(part);
    }
    begin = end + 1;
  }
  std::wstring result(path.substr(0, rootLength));
  for (size_t i = 0; i < parts.size(); ++i) {
    if (i != 0) result += L'\\';
    result += parts[i];
  }
  return result;
}

// Empty when the system does not say it.
std::wstring CurrentDirectory() {
  std::wstring folder(GetCurrentDirectoryW(0, nullptr), L'\0');
  const DWORD length = GetCurrentDirectoryW(static_cast<DWORD>(folder.size()), folder.data());
  folder.resize(length < folder.size() ? length : 0);
  return folder;
}

DWORD WriteAll(HANDLE file, std::string_view bytes) {
  constexpr size_t kChunk = size_t{16} << 20;
  while (!bytes.empty()) {
    const DWORD count = static_cast<DWORD>(std::min(bytes.size(), kChunk));
    DWORD written = 0;
    if (!WriteFile(file, bytes.data(), count, &written, nullptr)) return GetLastError();
    if (written == 0) return ERROR_WRITE_FAULT;
    bytes.remove_prefix(written);
  }
  return ERROR_SUCCESS;
}

}  // namespace

std::wstring ExtendPath(std::wstring_view path, std::wstring_view currentDirectory) {
  if (path.empty() || path.starts_with(kLocalPrefix) || path.starts_with(L"\\\\.\\")) return std::wstring(path);
  std::wstring full(path);
  std::replace(full.begin(), full.end(), L'/', L'\\');
  if (full.starts_with(L"\\\\")) {
    return WithoutDots(std::wstring(kNetworkPrefix) + full.substr(2), kNetworkPrefix.size());
  }
  if (!IsDriveAbsolute(full)) {
    if (currentDirectory.starts_with(kLocalPrefix)) currentDirectory.remove_prefix(kLocalPrefix.size());
    if (full.starts_with(L"\\")) {  // the root of the current drive
      full = std::wstring(currentDirectory.substr(0, 2)) + full;
    } else {
      full = std::wstring(currentDirectory) + L"\\" + full;
      if (full.starts_with(L"\\\\")) return ExtendPath(full, {});
    }
  }
  const std::wstring extended = std::wstring(kLocalPrefix) + full;
  return WithoutDots(extended, kLocalPrefix.size() + 3);
}

std::wstring ExtendedPath(std::wstring_view path) {
  // "C:name" means a current directory per drive, which only the system knows.
  if (path.size() >= 2 && path[1] == L':' && (path.size() == 2 || (path[2] != L'\\' && path[2] != L'/'))) {
    const std::wstring name(path);
    std::wstring full(GetFullPathNameW(name.c_str(), 0, nullptr, nullptr), L'\0');
    full.resize(GetFullPathNameW(name.c_str(), static_cast<DWORD>(full.size()), full.data(), nullptr));
    return ExtendPath(full, {});
  }
  const bool isAbsolute = (path.size() >= 3 && path[1] == L':') || path.starts_with(L"\\\\");
  if (isAbsolute) return ExtendPath(path, {});
  const std::wstring folder = CurrentDirectory();
  return folder.empty() ? std::wstring(path) : ExtendPath(path, folder);
}

std::wstring ShownPath(std::wstring_view extendedPath) {
  if (extendedPath.starts_with(kNetworkPrefix)) {
    return L"\\\\" + std::wstring(extendedPath.substr(kNetworkPrefix.size()));
  }
  constexpr size_t kDriveLength = 3;  // other names behind the prefix, such as volumes, mean nothing without it
  const std::wstring_view rest = extendedPath.substr(std::min(kLocalPrefix.size(), extendedPath.size()));
  const bool isOnDrive = extendedPath.starts_with(kLocalPrefix) && rest.size() >= kDriveLength && rest[1] == L':';
  return std::wstring(isOnDrive ? rest : extendedPath);
}

std::wstring FinalPath(HANDLE file) {
  constexpr DWORD kLongestPath = 32767;
  std::wstring path(MAX_PATH, L'\0');
  DWORD length = GetFinalPathNameByHandleW(file, path.data(), MAX_PATH, FILE_NAME_NORMALIZED);
  if (length >= MAX_PATH) {  // then it is the size that is needed
    path.resize(kLongestPath + 1);
    length = GetFinalPathNameByHandleW(file, path.data(), kLongestPath + 1, FILE_NAME_NORMALIZED);
  }
  path.resize(length <= kLongestPath ? length : 0);
  return path;
}

bool PathExists(std::wstring_view path) {
  return GetFileAttributesW(ExtendedPath(path).c_str()) != INVALID_FILE_ATTRIBUTES;
}

bool IsAbsent(std::wstring_view path) {
  if (PathExists(path)) return false;
  const DWORD error = GetLastError();
  return error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND;
}

bool FolderExists(std::wstring_view path) {
  const DWORD attributes = GetFileAttributesW(ExtendedPath(path).c_str());
  return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
}

KernelHandle OpenForReading(std::wstring_view path) {
  constexpr DWORD kShareAll = FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE;
  return KernelHandle(CreateFileW(ExtendedPath(path).c_str(), GENERIC_READ, kShareAll, nullptr, OPEN_EXISTING,
                                  FILE_FLAG_SEQUENTIAL_SCAN, nullptr));
}

DWORD ReadBytes(HANDLE file, size_t count, std::string& bytes) {
  bytes.resize(count);
  size_t filled = 0;
  while (filled < bytes.size()) {
    constexpr size_t kChunk = size_t{16} << 20;
    DWORD read = 0;
    if (!ReadFile(file, bytes.data() + filled, static_cast<DWORD>(std::min(bytes.size() - filled, kChunk)), &read,
                  nullptr)) {
      const DWORD error = GetLastError();
      bytes.resize(filled);
      return error;
    }
    if (read == 0) break;
    filled += read;
  }
  bytes.resize(filled);
  return ERROR_SUCCESS;
}

DWORD ReadWholeFile(std::wstring_view path, uint64_t limit, std::string& bytes) {
  const KernelHandle file = OpenForReading(path);
  if (!file) return GetLastError();
  LARGE_INTEGER size{};
  if (!GetFileSizeEx(file.Get(), &size)) return GetLastError();
  if (static_cast<uint64_t>(size.QuadPart) > limit) return ERROR_FILE_TOO_LARGE;
  // A file that shrinks meanwhile ends early, one that grows is cut.
  return ReadBytes(file.Get(), static_cast<size_t>(size.QuadPart), bytes);
}

DWORD WriteWholeFile(std::wstring_view path, std::string_view bytes, FileRights rights) {
  PartialFile file(path, rights);
  DWORD error = file.Create();
  if (error == ERROR_SUCCESS) error = file.Write(bytes);
  if (error == ERROR_SUCCESS) error = file.Publish();
  return error;
}

PartialFile::~PartialFile() {
  m_file.Reset();
  if (m_isCreated) DeleteFileW((m_path + kPartialSuffix).c_str());
}

DWORD PartialFile::Create() {
  const PrivateAccess rights = m_rights == FileRights::kPrivate ? PrivateAccess::OfFile() : PrivateAccess();
  if (rights.Error() != ERROR_SUCCESS) return rights.Error();
  m_file = CreateFreshFile((m_path + kPartialSuffix).c_str(), GENERIC_READ | GENERIC_WRITE, 0, rights.Attributes());
  if (!m_file) return GetLastError();
  m_isCreated = true;
  return ERROR_SUCCESS;
}

DWORD PartialFile::Write(std::string_view bytes) {
  return WriteAll(m_file.Get(), bytes);
}

DWORD PartialFile::Flush() {
  return FlushFileBuffers(m_file.Get()) ? ERROR_SUCCESS : GetLastError();
}

DWORD PartialFile::Publish() {
  if (const DWORD flushError = Flush(); flushError != ERROR_SUCCESS) return flushError;
  m_file.Reset();
  const DWORD error = PublishPartialFile(m_path);
  if (error == ERROR_SUCCESS) m_isCreated = false;
  return error;
}

DWORD PublishPartialFile(std::wstring_view path) {
  const std::wstring target = ExtendedPath(path);
  const std::wstring partial = target + kPartialSuffix;
  return MoveFileExW(partial.c_str(), target.c_str(), MOVEFILE_REPLACE_EXISTING | MOVEFILE_WRITE_THROUGH)
             ? ERROR_SUCCESS
             : GetLastError();
}

DWORD CreateFolders(std::wstring_view path) {
  const std::wstring full = ExtendedPath(path);
  if (FolderExists(full) || CreateDirectoryW(full.c_str(), nullptr)) return ERROR_SUCCESS;
  DWORD error = GetLastError();
  const size_t separator = full.find_last_of(L'\\');
  if (error == ERROR_PATH_NOT_FOUND && separator != std::wstring::npos && separator > kLocalPrefix.size()) {
    error = CreateFolders(full.substr(0, separator));
    if (error == ERROR_SUCCESS && !CreateDirectoryW(full.c_str(), nullptr)) error = GetLastError();
  }
  return error == ERROR_ALREADY_EXISTS && FolderExists(full) ? ERROR_SUCCESS : error;
}

std::wstring ExpandEnvironment(std::wstring_view text) {
  std::wstring source(text);
  const DWORD size = ExpandEnvironmentStringsW(source.c_str(), nullptr, 0);
  std::wstring expanded(size, L'\0');
  const DWORD written = ExpandEnvironmentStringsW(source.c_str(), expanded.data(), size);
  if (written == 0 || written > size) return source;
  expanded.resize(written - 1);  // the count includes the terminator
  return expanded;
}
