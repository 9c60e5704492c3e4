#include "systeminfo/handle_table.h"

#include <gmock/gmock.h>

namespace systeminfo {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

void Append(std::string& bytes, uint64_t number, size_t size) {
  for (size_t i = 0; i < size; ++i)
    bytes += static_cast<char>(number >> (8 * i));
}

struct Entry {
  uint32_t owner;
  uint16_t value;
};

std::string Table(uint32_t claimed, std::initializer_list<Entry> entries) {
  std::string bytes;
  Append(bytes, claimed, 4);
  bytes += "pad.";
  for (const Entry& entry : entries) {
    Append(bytes, entry.owner, 4);
    bytes += "tf";  // type and flags
    Append(bytes, entry.value, 2);
    bytes += "0123456789abcdef";  // address and access
  }
  return bytes;
}

TEST(HandleTable, HandlesAreGroupedByProcessInTheOrderOfTheTable) {
  const HandleTable table(
      Table(7, {{4, 0x10}, {4, 8}, {0xFFFF'FFFC, 0xFFFF}, {4, 0x14}, {0, 4}, {0xFFFF'FFFC, 0}, {8, 8}}));
  EXPECT_THAT(table.HandlesOf(4), ElementsAre(0x10, 8, 0x14));
  EXPECT_THAT(table.HandlesOf(0xFFFF'FFFC), ElementsAre(0xFFFF, 0));
  EXPECT_THAT(table.HandlesOf(0), ElementsAre(4));
  EXPECT_THAT(table.HandlesOf(8), ElementsAre(8));
  EXPECT_THAT(table.HandlesOf(12), IsEmpty());
  EXPECT_EQ(table.MissingEntries(), 0u);
}

TEST(HandleTable, CountBeyondTheBytesIsCutAtTheLastWholeEntry) {
  const std::string whole = Table(0xFFFF'FFFF, {{4, 1}, {4, 2}, {8, 3}});
  for (size_t size = 0; size <= whole.size(); ++size) {
    const std::string exactly = whole.substr(0, size);  // so that a read behind it is one outside
    const HandleTable table(exactly);
    const size_t entries = size < 8 ? 0 : (size - 8) / 24;
    EXPECT_EQ(table.HandlesOf(4).size() + table.HandlesOf(8).size(), entries) << size;
    EXPECT_EQ(table.MissingEntries(), size < 8 ? 0 : 0xFFFF'FFFF - entries) << size;
  }
  // Entries that the count leaves out are not looked at.
  EXPECT_THAT(HandleTable(Table(1, {{4, 1}, {4, 2}})).HandlesOf(4), ElementsAre(1));
}

TEST(LeadingCountedString, CharactersHaveToLieInTheReply) {
  constexpr uint64_t kBase = 0x7FF0'0000'1000;
  const auto reply = [](uint16_t length, uint64_t address) {
    std::string bytes;
    Append(bytes, length, 2);
    Append(bytes, length, 2);
    Append(bytes, 0, 4);
    Append(bytes, address, 8);
    bytes.append("F\0i\0l\0e\0", 8);
    return bytes;
  };
  const struct {
    uint16_t length;
    uint64_t address;
    std::optional<std::u16string> expected;
  } rows[] = {
      {8, kBase + 16, u"File"},
      {4, kBase + 18, u"il"},
      {7, kBase + 16, u"Fil"},  // half a character is none
      {0, 0, u""},
      {8, kBase + 17, std::nullopt},
      {9, kBase + 16, std::nullopt},
      {2, kBase + 24, std::nullopt},
      {2, kBase - 1, std::nullopt},
      {2, 0, std::nullopt},
      {2, ~uint64_t{0}, std::nullopt},
      {0xFFFF, kBase + 16, std::nullopt},
  };
  for (const auto& row : rows)
    EXPECT_EQ(LeadingCountedString(reply(row.length, row.address), kBase), row.expected) << row.address;
  EXPECT_EQ(LeadingCountedString(reply(8, kBase + 16).substr(0, 15), kBase), std::nullopt);
}

}  // namespace
}  // namespace systeminfo
