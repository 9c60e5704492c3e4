#include "core/string.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <string>

#include "core/path_string.h"

namespace {

std::wstring Wide(std::wstring_view text) {
  return std::wstring(text);
}

// The text of a string, writable, as a stray pointer would have it.
wchar_t* Stray(const qx::String& text) {
  return const_cast<wchar_t*>(text.c_str());
}

}  // namespace

TEST(String, TextSurvivesGrowthCopyAndMove) {
  qx::String text;
  EXPECT_STREQ(text.c_str(), L"");
  std::wstring expected;
  for (int i = 0; i < 2000; ++i) {
    text += static_cast<wchar_t>(L'a' + i % 26);
    expected += static_cast<wchar_t>(L'a' + i % 26);
  }
  const qx::String copy = text;
  qx::String moved = std::move(text);
  EXPECT_EQ(Wide(moved), expected);
  moved.clear();
  EXPECT_STREQ(moved.c_str(), L"");
  EXPECT_EQ(Wide(copy), expected) << "a copy has a buffer of its own";
  moved = copy;
  EXPECT_EQ(Wide(moved), expected);
  moved = std::wstring_view(L"short");
  EXPECT_STREQ(moved.c_str(), L"short");
}

TEST(String, AppendsPartsOfItself) {
  qx::String text(L"abc");
  for (int i = 0; i < 6; ++i)
    text += text;  // with and without growth
  EXPECT_EQ(text.size(), 192u);
  text.reserve(1000);
  text.append(std::wstring_view(text).substr(1, 3));
  EXPECT_EQ(Wide(text).substr(190), L"bcbca");
  text.assign(std::wstring_view(text).substr(189));
  EXPECT_EQ(Wide(text), L"abcbca");
}

TEST(String, ResizingFillsWithZerosAndShortensWithoutLosingRoom) {
  qx::String text(L"abcdef");
  text.resize(3);
  text.resize(5);
  EXPECT_EQ(Wide(text), std::wstring(L"abc\0\0", 5));
  text.append(2, L'x');
  EXPECT_EQ(Wide(text), std::wstring(L"abc\0\0xx", 7));
  EXPECT_THROW(text[7], std::out_of_range);
  EXPECT_THROW(text.reserve(SIZE_MAX / 2), std::length_error);
}

TEST(String, ComparesByCodeUnitsWithEveryKindOfText) {
  const qx::String text(L"b");
  EXPECT_TRUE(text == qx::String(L"b"));
  EXPECT_TRUE(text == L"b" && L"b" == text && text == std::wstring(L"b") && text != L"B");
  EXPECT_TRUE(text < qx::String(L"ba") && text > L"B" && std::wstring_view(L"a") < text);
  EXPECT_TRUE(qx::PathString(L"b") == text && qx::PathString(L"a") < qx::PathString(L"b"));
}

TEST(String, DamagedGuardThrowsAtTheNextAccess) {
  qx::String overrun(L"text");
  const size_t capacity = overrun.capacity();
  Stray(overrun)[capacity] = L'!';  // the terminating zero is not a guard
  EXPECT_NO_THROW(overrun.size());
  std::memset(Stray(overrun) + capacity + 1, 0, sizeof(uint16_t));  // a character may be wider than the guard
  EXPECT_THROW(overrun.c_str(), qx::StringGuardException);
  EXPECT_THROW(overrun.size(), qx::StringGuardException);
  EXPECT_THROW(overrun += L'x', qx::StringGuardException);
  EXPECT_THROW((void)(overrun == L"text"), qx::StringGuardException);

  qx::String underrun(L"text");
  Stray(underrun)[-1] = 0;
  EXPECT_THROW((void)std::wstring_view(underrun), qx::StringGuardException);
  EXPECT_THROW(static_cast<void>(qx::String(underrun)), qx::StringGuardException);
}

TEST(PathString, HoldsPathsOf260CharactersBeforeItGrows) {
  qx::PathString path;
  const wchar_t* const buffer = path.c_str();
  path.append(260, L'x');
  EXPECT_EQ(path.c_str(), buffer);
  EXPECT_EQ(path.capacity(), 260u);
  path += L"\\longer";
  EXPECT_EQ(path.size(), 267u);
  EXPECT_EQ(qx::PathStringT<16>(L"abc").capacity(), 16u);
}
