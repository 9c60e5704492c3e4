#include "stutil/deflater.h"

#include <libdeflate.h>

#include <algorithm>
#include <new>

#include "stutil/deflate_join.h"

namespace stutil {
namespace {

constexpr int kLevel = 6;

}  // namespace

void Deflater::Free::operator()(libdeflate_compressor* compressor) const {
  libdeflate_free_compressor(compressor);
}

Deflater::Deflater() : m_compressor(libdeflate_alloc_compressor(kLevel)) {
  if (!m_compressor) throw std::bad_alloc();
}

bool Deflater::Append(std::span<const uint8_t> input, StreamEnd end, std::vector<uint8_t>& output) {
  const size_t bound = libdeflate_deflate_compress_bound(m_compressor.get(), input.size());
  if (m_scratch.size() < bound) m_scratch.resize(bound);
  const size_t size =
      libdeflate_deflate_compress(m_compressor.get(), input.data(), input.size(), m_scratch.data(), m_scratch.size());
  if (size == 0) return false;
  const size_t begin = output.size();
  output.insert(output.end(), m_scratch.begin(), m_scratch.begin() + static_cast<std::ptrdiff_t>(size));
  if (end == StreamEnd::kFinal || MakeContinuable(output, begin)) return true;
  output.resize(begin);
  return false;
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
