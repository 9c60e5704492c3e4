#include "systeminfo/catalog_index.h"

#include <gmock/gmock.h>

namespace {

using testing::IsNull;
using testing::Pointee;
using namespace std::string_literals;

std::string Utf16(std::string_view text) {
  std::string bytes;
  for (const char character : text)
    bytes += {character, '\0'};
  return bytes;
}

TEST(CatalogSubjects, OnlyTwoAlgorithmsListHashes) {
  EXPECT_EQ(SubjectFormOf("1.3.6.1.4.1.311.12.1.2"), SubjectForm::kHexText);
  EXPECT_EQ(SubjectFormOf("1.3.6.1.4.1.311.12.1.3"), SubjectForm::kBytes);
  for (const char* other : {"", "1.3.6.1.4.1.311.12.1.1", "1.3.6.1.4.1.311.12.1.33", "1.3.6.1.4.1.311.12.1"})
    EXPECT_EQ(SubjectFormOf(other), std::nullopt) << other;
}

TEST(CatalogSubjects, HexTextIsDecodedInEitherCaseAndNeverFails) {
  const struct {
    std::string identifier, expected;
  } rows[] = {
      {Utf16("00fFA9"), "\x00\xFF\xA9"s},
      {Utf16("abc"), "\xAB"},          // half a byte is left out
      {Utf16("ab").substr(0, 3), ""},  // so is a cut character
      {Utf16("0G"), "\x47"},           // no digit: the code of 'G'
      {"\x31\x12\x32\x34"s, "\x12"},   // only the low bytes count
      {"", ""},
      {Utf16(std::string(600, '7')), std::string(300, '\x77')},
  };
  for (const auto& row : rows)
    EXPECT_EQ(SubjectHash(row.identifier, SubjectForm::kHexText), row.expected) << row.expected;
  EXPECT_EQ(SubjectHash("\x00g"s, SubjectForm::kBytes), "\x00g"s);
}

TEST(CatalogHashIndex, HashIsFoundOnlyWhole) {
  CatalogHashIndex index;
  index.AddHash("before any catalog");
  index.AddCatalog(L"one");
  index.AddHash("\xFF\x01");
  index.AddHash("\x7F\x01");
  index.AddHash("abc");
  index.AddCatalog(L"two");
  index.AddCatalog(L"three");
  index.AddHash("abcd");
  index.AddHash("\x7F\x02");
  index.Sort();
  EXPECT_EQ(index.Hashes(), 5u);
  EXPECT_THAT(index.Find("\xFF\x01"), Pointee(std::wstring(L"one")));
  EXPECT_THAT(index.Find("\x7F\x01"), Pointee(std::wstring(L"one")));
  EXPECT_THAT(index.Find("abc"), Pointee(std::wstring(L"one")));
  EXPECT_THAT(index.Find("abcd"), Pointee(std::wstring(L"three")));
  EXPECT_THAT(index.Find("\x7F\x02"), Pointee(std::wstring(L"three")));
  for (const char* absent : {"", "ab", "abcde", "abd", "\xFF\x02", "\x01\x01", "before any catalog"})
    EXPECT_THAT(index.Find(absent), IsNull()) << absent;
  EXPECT_THAT(CatalogHashIndex().Find("abc"), IsNull());
}

}  // namespace
