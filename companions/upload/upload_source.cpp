#include "companions/upload/upload_source.h"

#include "core/files.h"

namespace qxlink {

DWORD FileSource::Open(const std::wstring& path, DWORD access, DWORD share) {
  m_file.Reset(CreateFileW(ExtendedPath(path).c_str(), access, share, nullptr, OPEN_EXISTING, FILE_FLAG_SEQUENTIAL_SCAN,
                           nullptr));
  LARGE_INTEGER size{};
  if (!m_file || !GetFileSizeEx(m_file.Get(), &size)) return GetLastError();
  m_size = static_cast<uint64_t>(size.QuadPart);
  return ERROR_SUCCESS;
}

DWORD FileSource::Open(const std::wstring& path) {
  return Open(path, GENERIC_READ, FILE_SHARE_READ);
}

DWORD FileSource::OpenForMe(const std::wstring& path) {
  return Open(path, GENERIC_READ | DELETE, 0);
}

DWORD FileSource::Delete() {
  FILE_DISPOSITION_INFO disposition{TRUE};
  const BOOL done = SetFileInformationByHandle(m_file.Get(), FileDispositionInfo, &disposition, sizeof disposition);
  return done ? ERROR_SUCCESS : GetLastError();
}

DWORD FileSource::ReadAt(uint64_t offset, std::span<char> buffer, size_t& count) {
  OVERLAPPED position{};
  position.Offset = static_cast<DWORD>(offset);
  position.OffsetHigh = static_cast<DWORD>(offset >> 32);
  DWORD read = 0;
  if (!ReadFile(m_file.Get(), buffer.data(), static_cast<DWORD>(buffer.size()), &read, &position)) {
    const DWORD error = GetLastError();
    if (error != ERROR_HANDLE_EOF) return error;
    read = 0;
  }
  count = read;
  return ERROR_SUCCESS;
}

DWORD MemorySource::ReadAt(uint64_t offset, std::span<char> buffer, size_t& count) {
  count = offset < m_bytes.size() ? m_bytes.substr(offset).copy(buffer.data(), buffer.size()) : 0;
  return ERROR_SUCCESS;
}

}  // namespace qxlink
