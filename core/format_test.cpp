#include "core/format.h"

#include <gtest/gtest.h>

#include <cstdint>

TEST(Format, ConversionsHaveMicrosoftsMeaning) {
  EXPECT_EQ(Format(L"no conversion"), L"no conversion");
  EXPECT_EQ(Format(L"%s|%S|%c", L"wide \u20AC", "narrow", L'\u00E9'), L"wide \u20AC|narrow|\u00E9");
  EXPECT_EQ(Format(L"%ls|%hs", L"wide", "narrow"), L"wide|narrow");
  EXPECT_EQ(Format(L"%llu %lld %I64u", UINT64_MAX, INT64_MIN, UINT64_MAX),
            L"18446744073709551615 -9223372036854775808 18446744073709551615");
  EXPECT_EQ(Format(L"%d %u %08X %.2f %%", -1, 4294967295u, 0xABCDu, 1.5), L"-1 4294967295 0000ABCD 1.50 %");
}

// The buffer grows from 256 characters by fours: the text must be whole on both sides of every step.
TEST(Format, TextOfAnyLengthIsWhole) {
  for (const size_t step : {256u, 1024u, 4096u, 16384u}) {
    for (size_t length = step - 2; length <= step + 2; ++length) {
      const std::wstring text(length, L'x');
      EXPECT_EQ(Format(L"%s", text.c_str()), text) << length;
      EXPECT_EQ(Format(L"%s-%d", text.c_str(), 7), text + L"-7") << length;
    }
  }
  const std::wstring longText(3'000'000, L'x');
  EXPECT_EQ(Format(L"<%s>", longText.c_str()).size(), longText.size() + 2);
}

TEST(Format, WhatCannotBeFormattedSaysSo) {
  const std::wstring tooLong(17u << 20, L'x');
  EXPECT_EQ(Format(L"%s", tooLong.c_str()), L"(cannot be formatted) %s");
}
