#include "stutil/pack_job.h"

namespace stutil {

void CompressJob(const PackJob& job, const JobInput& input, Deflater& deflater, PackedJob& packed) {
  const StreamEnd end = job.isPiece && !job.isLastPiece ? StreamEnd::kContinuable : StreamEnd::kFinal;
  std::span<const uint8_t> rest(input.bytes);
  packed.bytes.clear();
  packed.parts.clear();
  for (const InputPart& source : input.parts) {
    const std::span<const uint8_t> bytes = rest.first(source.size);
    rest = rest.subspan(source.size);
    PackedPart part{source.error, source.size, 0, packed.bytes.size(), 0};
    if (part.error == ERROR_SUCCESS) {
      part.crc = Crc32(bytes);
      if (!deflater.Append(bytes, end, packed.bytes)) part.error = ERROR_INVALID_DATA;
    }
    part.end = packed.bytes.size();
    packed.parts.push_back(part);
  }
}

}  // namespace stutil
