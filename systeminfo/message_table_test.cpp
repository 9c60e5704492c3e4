#include "systeminfo/message_table.h"

#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <string>
#include <vector>

namespace systeminfo {
namespace {

struct Block {
  uint32_t low, high, offset;
};

template <class Number>
void Append(std::string& bytes, Number number) {
  bytes.append(reinterpret_cast<const char*>(&number), sizeof number);
}

std::string Table(const std::vector<Block>& blocks, const std::string& entries) {
  std::string bytes;
  Append(bytes, static_cast<uint32_t>(blocks.size()));
  for (const Block& block : blocks) {
    for (const uint32_t number : {block.low, block.high, block.offset})
      Append(bytes, number);
  }
  return bytes + entries;
}

std::string Entry(uint16_t length, uint16_t flags, const std::string& text) {
  std::string bytes;
  Append(bytes, length);
  Append(bytes, flags);
  return bytes + text;
}

const std::string kAnsi = Entry(8, 0, std::string("ab\0\0", 4));
const std::string kWide = Entry(8, 1, std::string("a\0\0\0", 4));
const std::string kRunsOn = Entry(8, 1, std::string("a\0b\0", 4));

TEST(IsSoundMessageTable, EveryEntryAndTextLiesInTheTable) {
  const struct {
    const char* name;
    std::string table;
    bool isSound;
  } rows[] = {
      {"no block", Table({}, ""), true},
      {"two blocks", Table({{1, 2, 28}, {9, 9, 44}}, kAnsi + kWide + kWide), true},
      {"shared entries", Table({{1, 1, 28}, {9, 9, 28}}, kWide), true},
      {"a text that ends in the next entry", Table({{1, 2, 16}}, kRunsOn + kWide), true},
      {"identifiers at the upper end", Table({{0xFFFFFFFF, 0xFFFFFFFF, 16}}, kWide), true},
      {"empty", "", false},
      {"cut number of blocks", std::string(3, '\0'), false},
      {"more blocks than bytes", Table({{1, 1, 16}}, kWide).replace(0, 4, "\xFF\xFF\xFF\xFF"), false},
      {"one block more than there are", Table({{1, 1, 16}}, "").replace(0, 1, "\2"), false},
      {"last before first", Table({{2, 1, 16}}, kWide + kWide), false},
      {"all identifiers", Table({{0, 0xFFFFFFFF, 16}}, kWide), false},
      {"an entry too many", Table({{1, 2, 16}}, kWide), false},
      {"entries behind the end", Table({{1, 1, 24}}, kWide), false},
      {"entries far behind the end", Table({{1, 1, 0xFFFFFFFC}}, kWide), false},
      {"an entry of no length", Table({{1, 1, 16}}, Entry(0, 1, std::string(4, '\0'))), false},
      {"an entry longer than the table", Table({{1, 1, 16}}, Entry(10, 1, std::string(4, '\0'))), false},
      {"a text that does not end", Table({{1, 1, 16}}, kRunsOn), false},
      {"zeros of the wrong parity", Table({{1, 1, 16}}, Entry(9, 1, std::string("a\1b\0\0", 5))), false},
      {"narrow text that does not end", Table({{1, 1, 16}}, Entry(8, 0, "abcd")), false},
  };
  for (const auto& row : rows)
    EXPECT_EQ(IsSoundMessageTable(row.table), row.isSound) << row.name;
}

TEST(IsSoundMessageTable, TablesMadeToTakeLongAreRefusedQuickly) {
  const std::string manyBlocks = Table(std::vector<Block>(50'000, {1, 100'000, 600'004}), std::string(400'000, '\4'));
  std::string entries;
  for (int i = 0; i < 100'000; ++i)
    entries += Entry(4, 1, "");
  const auto begin = std::chrono::steady_clock::now();
  EXPECT_FALSE(IsSoundMessageTable(manyBlocks));
  EXPECT_FALSE(IsSoundMessageTable(Table(std::vector<Block>(50'000, {1, 100'000, 600'004}), entries + kWide)));
  EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(2));
}

}  // namespace
}  // namespace systeminfo
