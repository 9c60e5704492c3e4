#include "stutil/pack_worker.h"

namespace stutil {

void PackWorker::Run(const PackJob& job, std::span<const FileRecord> files, const SourceFile* source,
                     PackedJob& packed) {
  packed.bytes.clear();
  packed.parts.clear();
  if (job.isPiece) {
    m_input.clear();
    const DWORD error = source->ReadAt(job.offset, job.length, m_input);
    return Compress(error, job.isLastPiece ? StreamEnd::kFinal : StreamEnd::kContinuable, packed);
  }
  for (const FileRecord& file : files.subspan(job.firstFile, job.fileCount)) {
    m_input.clear();
    const DWORD error = SourceFile(file.path).Read(file.size, m_input);
    Compress(error, StreamEnd::kFinal, packed);
  }
}

void PackWorker::Compress(DWORD readError, StreamEnd end, PackedJob& packed) {
  PackedPart part{readError, m_input.size(), 0, packed.bytes.size(), packed.bytes.size()};
  if (part.error == ERROR_SUCCESS) {
    part.crc = Crc32(m_input);
    if (!m_deflater.Append(m_input, end, packed.bytes)) part.error = ERROR_INVALID_DATA;
    part.end = packed.bytes.size();
  }
  packed.parts.push_back(part);
}

}  // namespace stutil
