#include "stutil/package_writer.h"

#include <gtest/gtest.h>

#include <algorithm>

#include "tests/support/test_folder.h"

namespace {

using stutil::PackageWriter;

TEST(PackageWriter, WritesNoByteBeforeItIsReady) {
  const TestFolder folder;
  const std::wstring path = folder.Path(L"package");
  std::string body(20 << 20, '-');
  PackageWriter writer(path, "head", body);
  for (size_t at = 0; at < body.size(); at += 1 << 20) {
    std::fill_n(body.begin() + static_cast<ptrdiff_t>(at), 1 << 20, 'x');
    writer.SetReady(at + (1 << 20));
  }
  EXPECT_FALSE(PathExists(path));
  ASSERT_EQ(writer.Finish(), 0u);
  std::string bytes;
  ASSERT_EQ(ReadWholeFile(path, 64 << 20, bytes), 0u);
  EXPECT_TRUE(bytes == "head" + std::string(20 << 20, 'x'));
}

TEST(PackageWriter, LeavesNothingWhenItIsGivenUp) {
  const TestFolder folder;
  const std::wstring path = folder.Path(L"package");
  const std::string body(1000, 'x');
  for (const size_t ready : {0, 500, 1000}) {
    PackageWriter writer(path, "head", body);
    if (ready != 0) writer.SetReady(ready);
  }
  EXPECT_FALSE(PathExists(path));
  EXPECT_FALSE(PathExists(path + kPartialSuffix));
}

TEST(PackageWriter, ReportsWhatKeepsItFromWriting) {
  const TestFolder folder;
  PackageWriter writer(folder.Path(L"missing\\package"), "head", "body");
  writer.SetReady(4);
  EXPECT_EQ(writer.Finish(), static_cast<DWORD>(ERROR_PATH_NOT_FOUND));
}

}  // namespace
