#include "stutil/deflater.h"

#include <libdeflate.h>
#include <miniz.h>

#include <algorithm>
#include <new>

namespace stutil {
namespace {

constexpr int kLevel = 6;

}  // namespace

void Deflater::Free::operator()(libdeflate_compressor* compressor) const {
  libdeflate_free_compressor(compressor);
}

struct Deflater::PieceCompressor {
  tdefl_compressor state;
};

Deflater::Deflater() : m_whole(libdeflate_alloc_compressor(kLevel)) {
  if (!m_whole) throw std::bad_alloc();
}

Deflater::~Deflater() = default;

bool Deflater::Append(std::span<const uint8_t> input, StreamEnd end, std::vector<uint8_t>& output) {
  const size_t size = end == StreamEnd::kFinal ? CompressWhole(input) : CompressPiece(input);
  output.insert(output.end(), m_scratch.begin(), m_scratch.begin() + static_cast<std::ptrdiff_t>(size));
  return size != 0;
}

size_t Deflater::CompressWhole(std::span<const uint8_t> input) {
  const size_t bound = libdeflate_deflate_compress_bound(m_whole.get(), input.size());
  if (m_scratch.size() < bound) m_scratch.resize(bound);
  return libdeflate_deflate_compress(m_whole.get(), input.data(), input.size(), m_scratch.data(), m_scratch.size());
}

size_t Deflater::CompressPiece(std::span<const uint8_t> input) {
  if (!m_pieces) m_pieces = std::make_unique<PieceCompressor>();
  tdefl_compressor& state = m_pieces->state;
  const mz_uint flags = tdefl_create_comp_flags_from_zip_params(kLevel, -MZ_DEFAULT_WINDOW_BITS, MZ_DEFAULT_STRATEGY);
  if (tdefl_init(&state, nullptr, nullptr, static_cast<int>(flags)) != TDEFL_STATUS_OKAY) return 0;
  // The bound of a whole stream, and room for the flush.
  constexpr size_t kFlushRoom = 64;
  const size_t bound = mz_compressBound(static_cast<mz_ulong>(input.size())) + kFlushRoom;
  if (m_scratch.size() < bound) m_scratch.resize(bound);
  size_t read = input.size();
  size_t written = m_scratch.size();
  const tdefl_status status = tdefl_compress(&state, input.data(), &read, m_scratch.data(), &written, TDEFL_SYNC_FLUSH);
  return status == TDEFL_STATUS_OKAY && read == input.size() && written < m_scratch.size() ? written : 0;
}

uint32_t Crc32(std::span<const uint8_t> bytes) {
  return libdeflate_crc32(0, bytes.data(), bytes.size());
}

uint32_t JoinCrc32(uint32_t head, uint32_t tail, uint64_t tailLength) {
  // A CRC is the sum (exclusive or) of a part that depends on the bytes and one that depends on what the CRC was
  // before. Running both beginnings over the same zeros leaves the second part alone.
  static constexpr uint8_t kZeros[16384]{};
  uint32_t fromHead = head;
  uint32_t fromNothing = 0;
  while (tailLength != 0) {
    const auto count = static_cast<size_t>(std::min<uint64_t>(tailLength, sizeof kZeros));
    fromHead = libdeflate_crc32(fromHead, kZeros, count);
    fromNothing = libdeflate_crc32(fromNothing, kZeros, count);
    tailLength -= count;
  }
  return fromHead ^ fromNothing ^ tail;
}

}  // namespace stutil
