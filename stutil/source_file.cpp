#include "stutil/source_file.h"

#include "core/files.h"

namespace stutil {
namespace {

// One system call. The number of bytes, 0 at the end of the file.
DWORD ReadOnce(HANDLE file, const uint64_t* offset, void* bytes, size_t size, DWORD& count) {
  OVERLAPPED position{};
  if (offset != nullptr) {
    position.Offset = static_cast<DWORD>(*offset);
    position.OffsetHigh = static_cast<DWORD>(*offset >> 32);
  }
  count = 0;
  if (ReadFile(file, bytes, static_cast<DWORD>(size), &count, offset != nullptr ? &position : nullptr)) {
    return ERROR_SUCCESS;
  }
  const DWORD error = GetLastError();
  return error == ERROR_HANDLE_EOF ? ERROR_SUCCESS : error;
}

}  // namespace

SourceFile::SourceFile(std::wstring_view path)
    : m_file(CreateFileW(ExtendedPath(path).c_str(), GENERIC_READ,
                         FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_EXISTING,
                         FILE_ATTRIBUTE_NORMAL, nullptr)) {
  if (!m_file) m_openError = GetLastError();
}

DWORD SourceFile::Read(uint64_t size, std::vector<uint8_t>& bytes) {
  return ReadFrom(nullptr, size, bytes);
}

DWORD SourceFile::ReadAt(uint64_t offset, uint64_t size, std::vector<uint8_t>& bytes) const {
  return ReadFrom(&offset, size, bytes);
}

DWORD SourceFile::ReadFrom(const uint64_t* offset, uint64_t size, std::vector<uint8_t>& bytes) const {
  if (m_openError != ERROR_SUCCESS) return m_openError;
  const size_t begin = bytes.size();
  bytes.resize(begin + static_cast<size_t>(size));
  size_t filled = 0;
  DWORD error = ERROR_SUCCESS;
  while (error == ERROR_SUCCESS && filled < size) {
    const uint64_t next = offset != nullptr ? *offset + filled : 0;
    DWORD count = 0;
    error = ReadOnce(m_file.Get(), offset != nullptr ? &next : nullptr, bytes.data() + begin + filled,
                     static_cast<size_t>(size) - filled, count);
    if (count == 0) break;
    filled += count;
  }
  bytes.resize(begin + (error == ERROR_SUCCESS ? filled : 0));
  return error;
}

}  // namespace stutil
