#include "core/edit_distance.h"

#include <gtest/gtest.h>

TEST(EditDistance, CountsInsertionsDeletionsReplacementsAndSwaps) {
  struct {
    const wchar_t* from;
    const wchar_t* to;
    size_t edits;
  } const rows[] = {
      {L"", L"", 0},        {L"", L"abc", 3},           {L"abc", L"abc", 0}, {L"ABC", L"abc", 0},
      {L"abc", L"abxc", 1}, {L"abxc", L"abc", 1},       {L"abc", L"axc", 1}, {L"abc", L"acb", 1},
      {L"abc", L"cab", 2},  {L"kitten", L"sitting", 3}, {L"ca", L"abc", 3},  {L"\u00c4", L"\u00e4", 1},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(EditDistance(row.from, row.to), row.edits) << row.from << " to " << row.to;
    EXPECT_EQ(EditDistance(row.to, row.from), row.edits) << row.to << " to " << row.from;
  }
}
