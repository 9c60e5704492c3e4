// Compresses what was read for a job.
#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include "stutil/deflater.h"
#include "stutil/pack_plan.h"
#include "stutil/source_reader.h"

namespace stutil {

// A compressed file, or a piece of one. The stream of a piece that is not the last can be continued.
struct PackedPart {
  DWORD error = ERROR_SUCCESS;  // a Windows error number; nothing else counts then
  uint64_t size = 0;            // uncompressed
  uint32_t crc = 0;
  size_t begin = 0;  // where the compressed bytes stand in PackedJob::bytes
  size_t end = 0;
};

struct PackedJob {
  std::vector<uint8_t> bytes;
  std::vector<PackedPart> parts;  // one for each file of a run, or the piece

  std::span<const uint8_t> BytesOf(const PackedPart& part) const {
    return std::span<const uint8_t>(bytes).subspan(part.begin, part.end - part.begin);
  }
};

// Replaces `packed`. Throws when memory runs out.
void CompressJob(const PackJob& job, const JobInput& input, Deflater& deflater, PackedJob& packed);

}  // namespace stutil
