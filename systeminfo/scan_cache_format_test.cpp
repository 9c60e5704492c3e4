#include "systeminfo/scan_cache_format.h"

#include <gtest/gtest.h>

#include "tests/support/scan_cache_file.h"

namespace systeminfo {
namespace {

using scan_cache_file::FileBytes;

std::vector<ScanCacheRecord> Records(size_t count) {
  std::vector<ScanCacheRecord> records(count);
  for (size_t i = 0; i < count; ++i)
    records[i].fileReferenceNumber = i;
  return records;
}

TEST(ScanCacheFormat, LengthOfTheFileBoundsTheCount) {
  const std::string three = FileBytes(3, Records(3));
  struct {
    const char* what;
    std::string bytes;
    size_t most;
    bool hasHeader;
    size_t records;
    bool isCutShort;
  } const rows[] = {
      {"no byte", "", 10, false, 0, false},
      {"one byte less than the count", three.substr(0, 0x23897), 10, false, 0, false},
      {"the count and no more", three.substr(0, 0x23898), 10, true, 0, true},
      {"no records", three.substr(0, 0x70000), 10, true, 0, true},
      {"all records", three, 10, true, 3, false},
      {"one byte less than three", three.substr(0, three.size() - 1), 10, true, 2, true},
      {"one byte of the second", three.substr(0, 0x70000 + 73), 10, true, 1, true},
      {"more than the count says", FileBytes(1, Records(3)), 10, true, 1, false},
      {"the largest count", FileBytes(UINT32_MAX, Records(3)), 10, true, 3, true},
      {"the largest count, few wanted", FileBytes(UINT32_MAX, Records(3)), 2, true, 2, false},
      {"count 0", FileBytes(0, Records(3)), 10, true, 0, false},
  };
  for (const auto& row : rows) {
    const ScanCache cache = ParseScanCache(row.bytes, row.most);
    EXPECT_EQ(cache.hasHeader, row.hasHeader) << row.what;
    EXPECT_EQ(cache.records.size(), row.records) << row.what;
    EXPECT_EQ(cache.isCutShort, row.isCutShort) << row.what;
    for (size_t i = 0; i < cache.records.size(); ++i)
      EXPECT_EQ(cache.records[i].fileReferenceNumber, i) << row.what;
  }
}

}  // namespace
}  // namespace systeminfo
