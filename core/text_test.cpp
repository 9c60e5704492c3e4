#include "core/text.h"

#include <gtest/gtest.h>

TEST(Text, WellFormedTextGoesBothWays) {
  struct {
    std::wstring_view wide;
    std::string_view utf8;
  } const rows[] = {
      {L"", ""},
      {L"plain", "plain"},
      {L"\u00E9\u20AC", "\xC3\xA9\xE2\x82\xAC"},
      {L"\xD83D\xDE00", "\xF0\x9F\x98\x80"},
      {std::wstring_view(L"a\0b", 3), std::string_view("a\0b", 3)},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(ToUtf8(row.wide), row.utf8);
    EXPECT_EQ(ToWide(row.utf8), row.wide);
  }
}

TEST(Text, EachBadUnitBecomesTheReplacementCharacter) {
  EXPECT_EQ(ToUtf8(L"a\xD83D"), "a\xEF\xBF\xBD");
  EXPECT_EQ(ToUtf8(L"\xDE00z"), "\xEF\xBF\xBDz");
  for (const char* bad : {"a\xFFz", "a\xC3z", "a\x80z"})
    EXPECT_EQ(ToWide(bad), L"a\uFFFDz") << bad;
  EXPECT_EQ(ToWide("a\xE2\x82").substr(0, 2), L"a\uFFFD") << "cut off in the middle";
}

TEST(Text, TrimmedTextHasNoBlanksAtItsEnds) {
  EXPECT_EQ(Trimmed(" \r\n\ta b\t \n"), "a b");
  EXPECT_EQ(Trimmed("a"), "a");
  for (const char* blank : {"", " ", "\r\n", static_cast<const char*>(nullptr)})
    EXPECT_EQ(Trimmed(blank), "");
  EXPECT_EQ(Trimmed(L" \t a b\u00A0\r\n"), L"a b");
  EXPECT_EQ(Trimmed(L" \n"), L"");
}
