#include "core/safe_file_name.h"

#include <gtest/gtest.h>

TEST(SafeFileName, OnlyWhatAFileNameCannotHoldIsReplaced) {
  struct {
    std::wstring text, name;
  } const rows[] = {
      {L"svc", L"svc_7.dmp"},
      {L"", L"_7.dmp"},
      {L"con", L"con_7.dmp"},
      {L"a. ", L"a. _7.dmp"},
      {L"\u00fc\u6771", L"\u00fc\u6771_7.dmp"},
      {L"..\\x", L".._x-"},
      {L"nul.x", L"_nul.x-"},
      {L"lpt1 .y", L"_lpt1 .y-"},
      {L"COM\u00b2.", L"_COM\u00b2.-"},
      {L"com10.x", L"com10.x_7.dmp"},
      {L"a<>:\"/\\|?*b", L"a_________b-"},
      {std::wstring(L"a\0\n", 3), L"a__-"},
  };
  for (const auto& row : rows) {
    const std::wstring name = SafeFileName(row.text, L"_7.dmp");
    if (row.name.ends_with(L"-")) {
      EXPECT_EQ(name.size(), row.name.size() + 8 + 6) << row.name;
      EXPECT_TRUE(name.starts_with(row.name)) << name;
    } else {
      EXPECT_EQ(name, row.name);
    }
  }
  EXPECT_NE(SafeFileName(L"a/b", L".csv"), SafeFileName(L"a:b", L".csv"));
  EXPECT_EQ(SafeFileName(L"nul", L".csv").substr(0, 5), L"_nul-");
}

TEST(SafeFileName, LongTextIsCutBetweenCharactersAndStaysDistinct) {
  const std::wstring fits(kLongestFileText, L'a');
  EXPECT_EQ(SafeFileName(fits, L".csv"), fits + L".csv");
  const std::wstring one = SafeFileName(std::wstring(100'000, L'a'), L"_4294967295.dmp");
  EXPECT_LE(one.size(), 255 - std::wstring_view(L".partial").size());
  EXPECT_NE(one, SafeFileName(std::wstring(100'001, L'a'), L"_4294967295.dmp"));
  const std::wstring pairs = L"a" + [] {
    std::wstring text;
    for (int i = 0; i < 200; ++i)
      text += L"\U0001F600";
    return text;
  }();
  const std::wstring cut = SafeFileName(pairs, L"");
  EXPECT_EQ(cut[kLongestFileText - 1], L'-');  // not half a character
}
