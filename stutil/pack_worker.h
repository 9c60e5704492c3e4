// Reads and compresses what a job asks for. One worker a thread; it owns the compressor and the buffers.
#pragma once

#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

#include "core/scoped.h"
#include "stutil/deflater.h"
#include "stutil/pack_plan.h"
#include "stutil/zip_selection.h"

namespace stutil {

// A file that others may read, write, rename and delete meanwhile. Any thread may read; the calls do not disturb each other.
class SourceFile {
 public:
  explicit SourceFile(std::wstring_view path);

  // Reads up to `size` bytes, fewer only where the file ends. The Windows error number of opening or reading, or 0.
  DWORD ReadAt(uint64_t offset, uint64_t size, std::vector<uint8_t>& bytes) const;

 private:
  KernelHandle m_file;
  DWORD m_error = ERROR_SUCCESS;
};

// A compressed file, or a piece of one. Its stream ends with the file; that of any other piece can be continued.
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
  // `source` is the open file of a piece, and not used for a run, whose files are opened here. Replaces `packed`.
  void Run(const PackJob& job, std::span<const FileRecord> files, const SourceFile* source, PackedJob& packed);

 private:
  void PackPart(const SourceFile& source, uint64_t offset, uint64_t size, StreamEnd end, PackedJob& packed);

  Deflater m_deflater;
  std::vector<uint8_t> m_input;
};

}  // namespace stutil
