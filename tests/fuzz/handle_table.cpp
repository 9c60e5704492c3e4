// The kernel's table of open handles, and the string that its description of a type begins with.
#include "systeminfo/handle_table.h"

#include <set>

#include "core/little_endian.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  using systeminfo::HandleTable;
  const HandleTable table(bytes);
  size_t present = 0;
  std::set<uint32_t> owners;
  for (size_t at = HandleTable::kEntriesOffset; at + HandleTable::kEntrySize <= bytes.size();
       at += HandleTable::kEntrySize) {
    owners.insert(ReadLittleEndian<uint32_t>(bytes, at));
  }
  for (const uint32_t owner : owners)
    present += table.HandlesOf(owner).size();
  const size_t claimed = bytes.size() < HandleTable::kEntriesOffset ? 0 : ReadLittleEndian<uint32_t>(bytes, 0);
  PROMISE(present + table.MissingEntries() == claimed);

  Input input(bytes);
  const uint64_t address = input.Take<uint64_t>();
  const auto text = systeminfo::LeadingCountedString(input.Rest(), address);
  PROMISE(!text || text->size() * sizeof(char16_t) <= input.Rest().size());
}
