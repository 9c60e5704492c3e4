#include "stutil/entry_assembler.h"

namespace stutil {

EntryState EntryAssembler::Add(const PackJob& job, const PackedJob& packed, size_t partIndex, const FileRecord& file) {
  const PackedPart& part = packed.parts[partIndex];
  if (job.isPiece) return AddPiece(job, part, packed.BytesOf(part), file);
  const bool added = part.error == ERROR_SUCCESS &&
                     m_archive.Add({file.entryName, file.lastWriteTime, part.size, part.crc}, packed.BytesOf(part));
  return added ? EntryState::kAdded : EntryState::kFailed;
}

EntryState EntryAssembler::AddPiece(const PackJob& job, const PackedPart& part, std::span<const uint8_t> bytes,
                                    const FileRecord& file) {
  if (job.offset == 0) {
    m_archive.BeginEntry(file.entryName);
    m_entry = ZipEntry{file.entryName, file.lastWriteTime};
    m_hasFailed = false;
  }
  m_hasFailed = m_hasFailed || part.error != ERROR_SUCCESS || !m_archive.Append(bytes);
  if (!m_hasFailed) {
    m_entry.crc = JoinCrc32(m_entry.crc, part.crc, part.size);
    m_entry.size += part.size;
  }
  if (!job.isLastPiece) return EntryState::kPending;
  return !m_hasFailed && m_archive.EndEntry(m_entry) ? EntryState::kAdded : EntryState::kFailed;
}

bool AddFile(ScopedZipArchive& archive, const FileRecord& file) {
  const std::span<const FileRecord> files(&file, 1);
  const SourceFile source(file.path);
  EntryAssembler assembler(archive);
  PackWorker worker;
  PackedJob packed;
  EntryState state = EntryState::kPending;
  for (const PackJob& job : PlanJobs(files)) {
    worker.Run(job, files, &source, packed);
    state = assembler.Add(job, packed, 0, file);
  }
  return state == EntryState::kAdded;
}

}  // namespace stutil
