// Deflate compression for the archive: whole buffers, one object a thread. Whole files go through the fast compressor,
// which makes complete streams only; the pieces of a big file go through the zip library's own, which can end one at a
// byte boundary so that the next may follow.
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
  ~Deflater();

  // Appends the compressed form of `input` to `output`. False when compression failed; `output` is as before then.
  bool Append(std::span<const uint8_t> input, StreamEnd end, std::vector<uint8_t>& output);

 private:
  size_t CompressWhole(std::span<const uint8_t> input);  // into m_scratch; 0 on failure
  size_t CompressPiece(std::span<const uint8_t> input);

  struct Free {
    void operator()(libdeflate_compressor* compressor) const;
  };
  std::unique_ptr<libdeflate_compressor, Free> m_whole;
  struct PieceCompressor;
  std::unique_ptr<PieceCompressor> m_pieces;  // made with the first piece
  std::vector<uint8_t> m_scratch;             // as big as the worst case needs, so that outputs are as big as they are
};

// The CRC-32 of zip, and that of `head` followed by `tail`, of which only the CRCs and the length of `tail` are known.
uint32_t Crc32(std::span<const uint8_t> bytes);
uint32_t JoinCrc32(uint32_t head, uint32_t tail, uint64_t tailLength);

}  // namespace stutil
