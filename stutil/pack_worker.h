// Reads and compresses what a job asks for. One worker a thread: it owns the compressor and the buffer.
#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include "stutil/deflater.h"
#include "stutil/pack_plan.h"
#include "stutil/source_file.h"
#include "stutil/zip_selection.h"

namespace stutil {

// A compressed file, or a piece of one. The stream of a piece that is not the last can be continued.
struct PackedPart {
  DWORD error = ERROR_SUCCESS;  // a Windows error number; nothing else counts then
  uint64_t size = 0;            // bytes that were read: never more than the record says, fewer when the file shrank
  uint32_t crc = 0;             // of these
  size_t begin = 0;             // where the compressed bytes stand in PackedJob::bytes
  size_t end = 0;
};

struct PackedJob {
  std::vector<uint8_t> bytes;
  std::vector<PackedPart> parts;  // one for each file of a run, or the piece

  std::span<const uint8_t> BytesOf(const PackedPart& part) const {
    return std::span<const uint8_t>(bytes).subspan(part.begin, part.end - part.begin);
  }
};

class PackWorker {
 public:
  // `source` is the file of a piece, open for all of its pieces; it is not used for a run, whose files are opened here.
  // Replaces `packed`. Throws when memory runs out.
  void Run(const PackJob& job, std::span<const FileRecord> files, const SourceFile* source, PackedJob& packed);

 private:
  void Compress(DWORD readError, StreamEnd end, PackedJob& packed);  // what is in m_input

  Deflater m_deflater;
  std::vector<uint8_t> m_input;
};

}  // namespace stutil
