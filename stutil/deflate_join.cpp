#include "stutil/deflate_join.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cstring>

namespace stutil {
namespace {

static_assert(std::endian::native == std::endian::little, "BitReader loads the stream's words as they are");

constexpr size_t kLiteralSymbols = 288;
constexpr size_t kDistanceSymbols = 32;
constexpr unsigned kEndOfBlock = 256;
constexpr unsigned kLongestCode = 15;

// Extra bits behind a length symbol (from 257) and a distance symbol. The symbols without a meaning are left out.
constexpr uint8_t kLengthExtra[] = {0, 0, 0, 0, 0, 0, 0, 0, 1, 1, 1, 1, 2, 2, 2,
                                    2, 3, 3, 3, 3, 4, 4, 4, 4, 5, 5, 5, 5, 0};
constexpr uint8_t kDistanceExtra[] = {0, 0, 0, 0, 1, 1, 2, 2,  3,  3,  4,  4,  5,  5,  6,
                                      6, 7, 7, 8, 8, 9, 9, 10, 10, 11, 11, 12, 12, 13, 13};
constexpr uint8_t kCodeLengthOrder[] = {16, 17, 18, 0, 8, 7, 9, 6, 10, 5, 11, 4, 12, 3, 13, 2, 14, 1, 15};

class BitReader {
 public:
  explicit BitReader(std::span<const uint8_t> bytes) : m_bytes(bytes) {}

  // At least 57 bits from the current position on; zeros stand behind the end.
  uint64_t Peek() const {
    const size_t byte = static_cast<size_t>(m_position >> 3);
    uint64_t word = 0;
    if (byte + sizeof word <= m_bytes.size()) {
      std::memcpy(&word, m_bytes.data() + byte, sizeof word);
    } else if (byte < m_bytes.size()) {
      std::memcpy(&word, m_bytes.data() + byte, m_bytes.size() - byte);
    }
    return word >> (m_position & 7);
  }
  void Skip(uint64_t bits) { m_position += bits; }
  unsigned Read(unsigned bits) {
    const auto value = static_cast<unsigned>(Peek() & ((uint64_t{1} << bits) - 1));
    Skip(bits);
    return value;
  }
  void AlignToByte() { m_position = (m_position + 7) & ~uint64_t{7}; }
  uint64_t Position() const { return m_position; }
  bool IsPastEnd() const { return m_position > uint64_t{m_bytes.size()} * 8; }

 private:
  std::span<const uint8_t> m_bytes;
  uint64_t m_position = 0;  // bits
};

// What a code word means to a reader that only skips.
struct Symbol {
  uint16_t value = 0;
  uint8_t codeBits = 0;  // 0: no such code word
  uint8_t skipBits = 0;  // the code word and its extra bits
};

// One entry for every value of the next bits, as many as the longest code word has.
class CodeTable {
 public:
  // `lengths` are the lengths of the symbols' code words, 0 for an unused symbol; `extra` the extra bits of the symbols
  // from `firstExtra` on. False when more code words are asked for than there can be.
  bool Build(std::span<const uint8_t> lengths, std::span<const uint8_t> extra, size_t firstExtra) {
    std::array<unsigned, kLongestCode + 1> count{};
    for (const uint8_t length : lengths)
      ++count[length];
    count[0] = 0;
    std::array<unsigned, kLongestCode + 2> next{};
    unsigned longest = 1;
    for (unsigned length = 1; length <= kLongestCode; ++length) {
      if (next[length] + count[length] > 1U << length) return false;
      if (count[length] != 0) longest = length;
      next[length + 1] = (next[length] + count[length]) << 1;
    }
    m_mask = (1U << longest) - 1;
    m_symbols.assign(size_t{1} << longest, Symbol{});
    for (size_t symbol = 0; symbol < lengths.size(); ++symbol) {
      const unsigned length = lengths[symbol];
      if (length == 0) continue;
      const size_t index = symbol - firstExtra;  // huge below firstExtra
      const unsigned extraBits = index < extra.size() ? extra[index] : 0;
      const Symbol entry{static_cast<uint16_t>(symbol), static_cast<uint8_t>(length),
                         static_cast<uint8_t>(length + extraBits)};
      for (size_t i = Reversed(next[length]++, length); i < m_symbols.size(); i += size_t{1} << length) {
        m_symbols[i] = entry;
      }
    }
    return true;
  }
  const Symbol& Find(uint64_t bits) const { return m_symbols[bits & m_mask]; }

 private:
  static size_t Reversed(unsigned code, unsigned length) {
    size_t reversed = 0;
    for (unsigned bit = 0; bit < length; ++bit)
      reversed |= size_t{code >> bit & 1} << (length - 1 - bit);
    return reversed;
  }

  std::vector<Symbol> m_symbols;
  uint64_t m_mask = 0;
};

class BlockSkimmer {
 public:
  explicit BlockSkimmer(std::span<const uint8_t> stream) : m_reader(stream) {}

  std::optional<FinalBlock> FindFinal() {
    for (;;) {
      const uint64_t begin = m_reader.Position();
      const bool isFinal = m_reader.Read(1) != 0;
      if (!SkipBlock(m_reader.Read(2)) || m_reader.IsPastEnd()) return std::nullopt;
      if (isFinal) return FinalBlock{begin, m_reader.Position()};
    }
  }

 private:
  bool SkipBlock(unsigned type) {
    switch (type) {
      case 0:
        return SkipStored();
      case 1:
        return BuildFixedCodes() && SkipSymbols();
      case 2:
        return ReadCodes() && SkipSymbols();
      default:
        return false;
    }
  }

  bool SkipStored() {
    m_reader.AlignToByte();
    const unsigned length = m_reader.Read(16);
    const unsigned complement = m_reader.Read(16);
    m_reader.Skip(uint64_t{length} * 8);
    return (length ^ complement) == 0xFFFF;
  }

  bool BuildFixedCodes() {
    std::array<uint8_t, kLiteralSymbols + kDistanceSymbols> lengths{};
    std::fill_n(lengths.begin(), 144, uint8_t{8});
    std::fill_n(lengths.begin() + 144, 112, uint8_t{9});
    std::fill_n(lengths.begin() + 256, 24, uint8_t{7});
    std::fill_n(lengths.begin() + 280, 8, uint8_t{8});
    std::fill_n(lengths.begin() + 288, 32, uint8_t{5});
    return BuildCodes(lengths, kLiteralSymbols);
  }

  bool BuildCodes(std::span<const uint8_t> lengths, size_t literalCount) {
    return m_literals.Build(lengths.first(literalCount), kLengthExtra, kEndOfBlock + 1) &&
           m_distances.Build(lengths.subspan(literalCount), kDistanceExtra, 0);
  }

  // The code words of a dynamic block, whose lengths are themselves compressed.
  bool ReadCodes() {
    const size_t literalCount = m_reader.Read(5) + 257;
    const size_t distanceCount = m_reader.Read(5) + 1;
    const size_t codeLengthCount = m_reader.Read(4) + 4;
    std::array<uint8_t, std::size(kCodeLengthOrder)> codeLengths{};
    for (size_t i = 0; i < codeLengthCount; ++i) {
      codeLengths[kCodeLengthOrder[i]] = static_cast<uint8_t>(m_reader.Read(3));
    }
    CodeTable& codes = m_distances;  // free until the distances are known
    if (literalCount > kLiteralSymbols || !codes.Build(codeLengths, {}, 0)) return false;

    std::array<uint8_t, kLiteralSymbols + kDistanceSymbols> lengths{};
    const size_t count = literalCount + distanceCount;
    for (size_t i = 0; i < count;) {
      const Symbol symbol = codes.Find(m_reader.Peek());
      if (symbol.codeBits == 0 || m_reader.IsPastEnd()) return false;
      m_reader.Skip(symbol.codeBits);
      if (symbol.value < 16) {
        lengths[i++] = static_cast<uint8_t>(symbol.value);
        continue;
      }
      if (symbol.value == 16 && i == 0) return false;
      const uint8_t repeated = symbol.value == 16 ? lengths[i - 1] : uint8_t{0};
      const size_t times = symbol.value == 16   ? 3 + m_reader.Read(2)
                           : symbol.value == 17 ? 3 + m_reader.Read(3)
                                                : 11 + m_reader.Read(7);
      if (times > count - i) return false;
      std::fill_n(lengths.begin() + static_cast<std::ptrdiff_t>(i), times, repeated);
      i += times;
    }
    return BuildCodes(std::span<const uint8_t>(lengths).first(count), literalCount);
  }

  bool SkipSymbols() {
    for (;;) {
      const uint64_t bits = m_reader.Peek();
      const Symbol literal = m_literals.Find(bits);
      if (literal.codeBits == 0 || m_reader.IsPastEnd()) return false;
      if (literal.value < kEndOfBlock) {
        m_reader.Skip(literal.skipBits);
        continue;
      }
      if (literal.value == kEndOfBlock) {
        m_reader.Skip(literal.skipBits);
        return true;
      }
      // At most 20 bits for the length and 28 for the distance: both are in `bits`.
      const Symbol distance = m_distances.Find(bits >> literal.skipBits);
      if (distance.codeBits == 0) return false;
      m_reader.Skip(uint64_t{literal.skipBits} + distance.skipBits);
    }
  }

  BitReader m_reader;
  CodeTable m_literals;
  CodeTable m_distances;
};

}  // namespace

std::optional<FinalBlock> FindFinalBlock(std::span<const uint8_t> stream) {
  return BlockSkimmer(stream).FindFinal();
}

bool MakeContinuable(std::vector<uint8_t>& bytes, size_t begin) {
  const auto block = FindFinalBlock(std::span<const uint8_t>(bytes).subspan(begin));
  if (!block) return false;
  bytes[begin + static_cast<size_t>(block->headerBit / 8)] &= static_cast<uint8_t>(~(1U << (block->headerBit % 8)));
  // The three zero bits of the empty stored block's header, zeros up to the next byte, then its length and complement.
  bytes.resize(begin + static_cast<size_t>((block->endBit + 3 + 7) / 8));
  bytes.insert(bytes.end(), {0x00, 0x00, 0xFF, 0xFF});
  return true;
}

}  // namespace stutil
