#include "systeminfo/message_table.h"

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace systeminfo {
namespace {

// MESSAGE_RESOURCE_DATA: the number of blocks, then MESSAGE_RESOURCE_BLOCK for each: the first and the last identifier,
// and where their entries (MESSAGE_RESOURCE_ENTRY: length, flags, text) begin.
constexpr size_t kBlockSize = 12;
constexpr size_t kEntryHeader = 4;
constexpr uint16_t kIsUnicode = 1;

template <class Number>
Number Get(std::string_view bytes, size_t offset) {
  Number number;
  std::memcpy(&number, bytes.data() + offset, sizeof number);
  return number;
}

class Table {
 public:
  explicit Table(std::string_view bytes)
      : m_bytes(bytes),
        m_entriesLeft(bytes.size() / kEntryHeader),
        m_lastZero(bytes.find_last_of('\0')),
        m_lastZeroPair{LastZeroPair(0), LastZeroPair(1)} {}

  bool IsSound() {
    if (m_bytes.size() < sizeof(uint32_t)) return false;
    const size_t blocks = Get<uint32_t>(m_bytes, 0);
    if (blocks > (m_bytes.size() - sizeof(uint32_t)) / kBlockSize) return false;
    for (size_t i = 0; i < blocks; ++i) {
      if (!IsSoundBlock(sizeof(uint32_t) + i * kBlockSize)) return false;
    }
    return true;
  }

 private:
  // Where the last 16-bit zero begins among the offsets of that parity; 0, where no text can be, for none.
  size_t LastZeroPair(size_t parity) const {
    for (size_t offset = m_bytes.size(); offset >= 2; --offset) {
      if (offset % 2 == parity && m_bytes[offset - 2] == 0 && m_bytes[offset - 1] == 0) return offset - 2;
    }
    return 0;
  }

  bool IsSoundBlock(size_t block) {
    const size_t low = Get<uint32_t>(m_bytes, block);
    const size_t high = Get<uint32_t>(m_bytes, block + 4);
    size_t entry = Get<uint32_t>(m_bytes, block + 8);
    // Blocks may share their entries, but no table needs more steps than it could hold entries.
    if (low > high || high - low >= m_entriesLeft) return false;
    m_entriesLeft -= high - low + 1;
    for (size_t id = low; id <= high; ++id) {
      if (entry > m_bytes.size() || m_bytes.size() - entry < kEntryHeader) return false;
      const size_t length = Get<uint16_t>(m_bytes, entry);
      if (length < kEntryHeader || length > m_bytes.size() - entry) return false;
      if (!TextEnds(entry)) return false;
      entry += length;
    }
    return true;
  }

  // A text that runs on beyond its own entry is odd but harmless, as long as it ends in the table.
  bool TextEnds(size_t entry) const {
    const size_t text = entry + kEntryHeader;
    if ((Get<uint16_t>(m_bytes, entry + 2) & kIsUnicode) != 0) return m_lastZeroPair[text % 2] >= text;
    return m_lastZero != std::string_view::npos && m_lastZero >= text;
  }

  std::string_view m_bytes;
  size_t m_entriesLeft;
  size_t m_lastZero;
  size_t m_lastZeroPair[2];
};

}  // namespace

bool IsSoundMessageTable(std::string_view table) {
  return Table(table).IsSound();
}

}  // namespace systeminfo
