// Puts packed files into an archive: the files of a run as they are, the pieces of a big file behind each other.
#pragma once

#include <span>

#include "stutil/pack_worker.h"
#include "stutil/scoped_zip_archive.h"

namespace stutil {

enum class EntryState {
  kAdded,
  kFailed,   // the file could not be read or added; the archive is as if it had never been tried
  kPending,  // more pieces have to follow
};

class EntryAssembler {
 public:
  explicit EntryAssembler(ScopedZipArchive& archive) : m_archive(archive) {}

  // Takes the part `partIndex` of `packed`, which belongs to `file`. The pieces of a file come in order, nothing
  // between.
  EntryState Add(const PackJob& job, const PackedJob& packed, size_t partIndex, const FileRecord& file);

 private:
  EntryState AddPiece(const PackJob& job, const PackedPart& part, std::span<const uint8_t> bytes,
                      const FileRecord& file);

  ScopedZipArchive& m_archive;
  ZipEntry m_entry;  // what is known so far of the file whose pieces are coming
  bool m_hasFailed = false;
};

// Packs one file on the calling thread. Throws when memory runs out.
bool AddFile(ScopedZipArchive& archive, const FileRecord& file);

}  // namespace stutil
