// Deflate compression for the archive: fast, whole buffers, one object a thread.
#pragma once

#include <cstdint>
#include <memory>
#include <span>
#include <vector>

struct libdeflate_compressor;

namespace stutil {

enum class StreamEnd {
  kFinal,        // a whole raw deflate stream
  kContinuable,  // ends at a byte boundary, another stream has to follow
};

class Deflater {
 public:
  Deflater();  // throws std::bad_alloc

  // Appends the compressed form of `input` to `output`. False when compression failed; `output` is as before then.
  bool Append(std::span<const uint8_t> input, StreamEnd end, std::vector<uint8_t>& output);

 private:
  struct Free {
    void operator()(libdeflate_compressor* compressor) const;
  };
  std::unique_ptr<libdeflate_compressor, Free> m_compressor;
  std::vector<uint8_t> m_scratch;  // as big as the worst case needs, so that outputs are as big as they are
};

// The CRC-32 of zip, and that of `head` followed by `tail`, of which only the CRCs and the length of `tail` are known.
uint32_t Crc32(std::span<const uint8_t> bytes);
uint32_t JoinCrc32(uint32_t head, uint32_t tail, uint64_t tailLength);

}  // namespace stutil
