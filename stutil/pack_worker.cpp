#include "stutil/pack_worker.h"

#include "core/files.h"

namespace stutil {

SourceFile::SourceFile(std::wstring_view path)
    : m_file(CreateFileW(ExtendedPath(path).c_str(), GENERIC_READ,
                         FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_EXISTING,
                         FILE_FLAG_SEQUENTIAL_SCAN, nullptr)) {
  if (!m_file) m_error = GetLastError();
}

DWORD SourceFile::ReadAt(uint64_t offset, uint64_t size, std::vector<uint8_t>& bytes) const {
  bytes.clear();
  if (m_error != ERROR_SUCCESS) return m_error;
  bytes.resize(static_cast<size_t>(size));
  size_t filled = 0;
  while (filled < bytes.size()) {
    OVERLAPPED position{};
    position.Offset = static_cast<DWORD>(offset + filled);
    position.OffsetHigh = static_cast<DWORD>((offset + filled) >> 32);
    DWORD count = 0;
    if (!ReadFile(m_file.Get(), bytes.data() + filled, static_cast<DWORD>(bytes.size() - filled), &count, &position)) {
      const DWORD error = GetLastError();
      if (error != ERROR_HANDLE_EOF) return error;
    }
    if (count == 0) break;
    filled += count;
  }
  bytes.resize(filled);
  return ERROR_SUCCESS;
}

void PackWorker::Run(const PackJob& job, std::span<const FileRecord> files, const SourceFile* source,
                     PackedJob& packed) {
  packed.bytes.clear();
  packed.parts.clear();
  if (job.isPiece) {
    PackPart(*source, job.offset, job.length, job.isLastPiece ? StreamEnd::kFinal : StreamEnd::kContinuable, packed);
    return;
  }
  for (const FileRecord& file : files.subspan(job.firstFile, job.fileCount)) {
    PackPart(SourceFile(file.path), 0, file.size, StreamEnd::kFinal, packed);
  }
}

void PackWorker::PackPart(const SourceFile& source, uint64_t offset, uint64_t size, StreamEnd end, PackedJob& packed) {
  PackedPart part;
  part.begin = packed.bytes.size();
  part.error = source.ReadAt(offset, size, m_input);
  if (part.error == ERROR_SUCCESS) {
    part.size = m_input.size();
    part.crc = Crc32(m_input);
    if (!m_deflater.Append(m_input, end, packed.bytes)) part.error = ERROR_INVALID_DATA;
  }
  part.end = packed.bytes.size();
  packed.parts.push_back(part);
}

}  // namespace stutil
