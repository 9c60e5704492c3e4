// Joins raw deflate streams. The compressor makes whole streams only; a big file is compressed in pieces, each a stream
// of its own, and this is what lets the pieces stand behind each other as one stream.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>

namespace stutil {

struct FinalBlock {
  uint64_t headerBit = 0;  // position of the block's first bit, which marks it as the final one
  uint64_t endBit = 0;     // one behind its last bit
};

// Skims a raw deflate stream (RFC 1951) without producing its data. Nothing when the stream is damaged or cut off.
std::optional<FinalBlock> FindFinalBlock(std::span<const uint8_t> stream);

// Changes the whole stream that begins at `begin` so that another one may follow: its final block no longer is one, and
// an empty stored block (a sync flush) brings it to a byte boundary. False, and nothing changed, when it is no whole
// stream.
bool MakeContinuable(std::vector<uint8_t>& bytes, size_t begin);

}  // namespace stutil
