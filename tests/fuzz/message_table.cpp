// A message table, looked up afterwards as the system does it: without asking where the offsets lead.
#include "systeminfo/message_table.h"

#include "core/little_endian.h"
#include "tests/fuzz/fuzz.h"

namespace {

// Reads the text of an entry up to its end, which must be in the table.
void ReadText(std::string_view table, size_t entry) {
  const size_t width = (ReadLittleEndian<uint16_t>(table, entry + 2) & 1) != 0 ? 2 : 1;
  bool isEnd = false;
  for (size_t at = entry + 4; !isEnd; at += width) {
    PROMISE(at + width <= table.size());
    isEnd = width == 2 ? ReadLittleEndian<uint16_t>(table, at) == 0 : table[at] == '\0';
  }
}

}  // namespace

void FuzzOne(std::string_view bytes) {
  if (!systeminfo::IsSoundMessageTable(bytes)) return;
  const auto blocks = ReadLittleEndian<uint32_t>(bytes, 0);
  for (size_t block = 0; block < blocks; ++block) {
    const size_t at = 4 + block * 12;
    const auto low = ReadLittleEndian<uint32_t>(bytes, at);
    const auto high = ReadLittleEndian<uint32_t>(bytes, at + 4);
    size_t entry = ReadLittleEndian<uint32_t>(bytes, at + 8);
    for (uint64_t id = low; id <= high; ++id) {
      PROMISE(entry + 4 <= bytes.size());
      ReadText(bytes, entry);
      entry += ReadLittleEndian<uint16_t>(bytes, entry);
    }
  }
}
