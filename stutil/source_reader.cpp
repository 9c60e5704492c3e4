#include "stutil/source_reader.h"

#include "core/files.h"

namespace stutil {

void SourceReader::Open(std::wstring_view path) {
  m_file.Reset(CreateFileW(ExtendedPath(path).c_str(), GENERIC_READ,
                           FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_EXISTING,
                           FILE_FLAG_SEQUENTIAL_SCAN, nullptr));
  m_openError = m_file ? ERROR_SUCCESS : GetLastError();
}

void SourceReader::Read(const PackJob& job, std::span<const FileRecord> files, JobInput& input) {
  input.bytes.clear();
  input.parts.clear();
  for (const FileRecord& file : files.subspan(job.firstFile, job.fileCount)) {
    if (job.offset == 0) Open(file.path);
    ReadPart(job.offset, job.isPiece ? job.length : file.size, input);
    if (!job.isPiece || job.isLastPiece) m_file.Reset();
  }
}

void SourceReader::ReadPart(uint64_t offset, uint64_t size, JobInput& input) {
  const size_t begin = input.bytes.size();
  size_t filled = 0;
  DWORD error = m_openError;
  if (error == ERROR_SUCCESS) input.bytes.resize(begin + static_cast<size_t>(size));
  while (error == ERROR_SUCCESS && filled < size) {
    OVERLAPPED position{};
    position.Offset = static_cast<DWORD>(offset + filled);
    position.OffsetHigh = static_cast<DWORD>((offset + filled) >> 32);
    DWORD count = 0;
    if (!ReadFile(m_file.Get(), input.bytes.data() + begin + filled, static_cast<DWORD>(size - filled), &count,
                  &position)) {
      error = GetLastError();
    }
    if (count == 0) break;
    filled += count;
  }
  if (error == ERROR_HANDLE_EOF) error = ERROR_SUCCESS;  // the file shrank
  if (error != ERROR_SUCCESS) filled = 0;
  input.bytes.resize(begin + filled);
  input.parts.push_back({error, filled});
}

}  // namespace stutil
