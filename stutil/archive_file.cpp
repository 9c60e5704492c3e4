#include "stutil/archive_file.h"

#include <algorithm>

#include "core/files.h"
#include "core/own_files.h"
#include "core/private_access.h"

namespace stutil {
namespace {

constexpr size_t kBufferSize = size_t{1} << 20;

}  // namespace

DWORD ArchiveFile::Create(std::wstring_view path) {
  m_path = path;
  const std::wstring target = ExtendedPath(path);
  if (target.empty()) return ERROR_PATH_NOT_FOUND;
  if (!DeleteFileW(target.c_str())) {
    const DWORD error = GetLastError();
    if (error != ERROR_FILE_NOT_FOUND) return error;
  }
  m_partialPath = target + kPartialSuffix;
  const PrivateAccess rights = PrivateAccess::OfFile();  // the package's content, not encrypted yet
  if (rights.Error() != ERROR_SUCCESS) return rights.Error();
  m_file = CreateFreshFile(m_partialPath.c_str(), GENERIC_WRITE, FILE_SHARE_READ, rights.Attributes());
  if (!m_file) return GetLastError();
  m_buffer.reserve(kBufferSize);
  return ERROR_SUCCESS;
}

ArchiveFile::~ArchiveFile() {
  if (!m_file) return;
  m_file.Reset();
  DeleteFileW(m_partialPath.c_str());
}

bool ArchiveFile::Write(uint64_t offset, const void* bytes, size_t size) {
  if (offset != m_bufferOffset + m_buffer.size() || size > kBufferSize - m_buffer.size()) {
    if (!Flush()) return false;
    m_bufferOffset = offset;
  }
  if (size >= kBufferSize) {
    m_bufferOffset += size;
    return WriteThrough(offset, bytes, size);
  }
  const char* const begin = static_cast<const char*>(bytes);
  m_buffer.insert(m_buffer.end(), begin, begin + size);
  return m_error == ERROR_SUCCESS;
}

bool ArchiveFile::Flush() {
  const bool written = WriteThrough(m_bufferOffset, m_buffer.data(), m_buffer.size());
  m_bufferOffset += m_buffer.size();
  m_buffer.clear();
  return written;
}

bool ArchiveFile::WriteThrough(uint64_t offset, const void* bytes, size_t size) {
  const char* next = static_cast<const char*>(bytes);
  while (size != 0 && m_error == ERROR_SUCCESS) {
    constexpr size_t kMost = size_t{16} << 20;
    OVERLAPPED position{};
    position.Offset = static_cast<DWORD>(offset);
    position.OffsetHigh = static_cast<DWORD>(offset >> 32);
    DWORD written = 0;
    if (!WriteFile(m_file.Get(), next, static_cast<DWORD>(std::min(size, kMost)), &written, &position)) {
      m_error = GetLastError();
    } else if (written == 0) {
      m_error = ERROR_WRITE_FAULT;
    }
    next += written;
    offset += written;
    size -= written;
  }
  return m_error == ERROR_SUCCESS;
}

DWORD ArchiveFile::Truncate(uint64_t size) {
  LARGE_INTEGER end{};
  end.QuadPart = static_cast<LONGLONG>(size);
  if (!SetFilePointerEx(m_file.Get(), end, nullptr, FILE_BEGIN) || !SetEndOfFile(m_file.Get())) return GetLastError();
  return ERROR_SUCCESS;
}

DWORD ArchiveFile::Publish(uint64_t size) {
  if (!Flush()) return m_error;
  if (const DWORD error = Truncate(size); error != ERROR_SUCCESS) return error;
  m_file.Reset();
  const DWORD error = PublishPartialFile(m_path);
  if (error != ERROR_SUCCESS) DeleteFileW(m_partialPath.c_str());
  return error;
}

}  // namespace stutil
