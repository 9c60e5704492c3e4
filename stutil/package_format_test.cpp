#include "stutil/package_format.h"

#include <gtest/gtest.h>

namespace {

using namespace std::string_literals;
using stutil::SplitPackage;

TEST(SplitPackage, GivesTheKeyBlobAndTheRest) {
  struct {
    std::string package;
    std::string keyBlob;
    std::string cipherText;
  } const rows[] = {
      {"\3\0\0\0\0\0\0\0keyTEXT"s, "key", "TEXT"},
      {"\3\0\0\0\0\0\0\0key"s, "key", ""},
      {"\0\0\0\0\0\0\0\0TEXT"s, "", "TEXT"},
      {"\0\0\0\0\0\0\0\0"s, "", ""},
      {"\0\1\0\0\0\0\0\0"s + std::string(256, 'k') + "T", std::string(256, 'k'), "T"},
  };
  for (const auto& row : rows) {
    const auto parts = SplitPackage(row.package);
    ASSERT_TRUE(parts);
    EXPECT_EQ(parts->keyBlob, row.keyBlob);
    EXPECT_EQ(parts->cipherText, row.cipherText);
  }
}

TEST(SplitPackage, RefusesLengthsThatReachBehindThePackage) {
  const std::string headers[] = {
      "\4\0\0\0\0\0\0\0"s,                  // by one
      "\0\0\0\x80\0\0\0\0"s,                // negative as 32 bits
      "\0\0\0\0\1\0\0\0"s,                  // 2^32: 0 without its upper half
      "\3\0\0\0\1\0\0\0"s,                  // 3 without its upper half
      "\3\0\0\0\0\0\0\x80"s,                // negative as 64 bits
      "\xF8\xFF\xFF\xFF\xFF\xFF\xFF\xFF"s,  // 0 when the header is added
      "\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF"s,  // 2^64 - 1
  };
  for (const auto& header : headers)
    EXPECT_FALSE(SplitPackage(header + "key"));
}

TEST(SplitPackage, RefusesEveryTruncationBeforeTheCipherText) {
  const std::string package = stutil::PackageHeader(5) + "k-e-y";
  for (size_t size = 0; size < package.size(); ++size)
    EXPECT_FALSE(SplitPackage(package.substr(0, size))) << size;
  EXPECT_TRUE(SplitPackage(package));
}

TEST(PackageHeader, IsTheLengthInEightBytesLowestFirst) {
  EXPECT_EQ(stutil::PackageHeader(140), "\x8C\0\0\0\0\0\0\0"s);
  EXPECT_EQ(stutil::PackageHeader(0xFEDCBA98), "\x98\xBA\xDC\xFE\0\0\0\0"s);
}

}  // namespace
