#include "stutil/zip_selection.h"

#include <gtest/gtest.h>

#include "stutil/pack_plan.h"

namespace stutil {
namespace {

std::wstring NamesOf(const std::vector<FileRecord>& files) {
  std::wstring names;
  for (const FileRecord& file : files)
    names += file.entryName;
  return names;
}

TEST(SelectWithinLimit, TakesTheNewestThatFit) {
  struct {
    const char* what;
    std::vector<FileRecord> files;  // path, entry name, size, time
    const wchar_t* selected;
    const wchar_t* skipped;
    uint64_t total;
  } const rows[] = {
      {"nothing", {}, L"", L"", 0},
      {"newest first", {{L"", L"a", 1, 10}, {L"", L"b", 1, 30}, {L"", L"c", 1, 20}}, L"bca", L"", 3},
      {"exactly the limit", {{L"", L"a", 60, 2}, {L"", L"b", 40, 1}}, L"ab", L"", 100},
      {"one byte more", {{L"", L"a", 60, 2}, {L"", L"b", 41, 1}}, L"a", L"b", 60},
      {"newest too big", {{L"", L"a", 101, 3}, {L"", L"b", 1, 2}, {L"", L"c", 99, 1}}, L"bc", L"a", 100},
      {"a later, smaller one fits", {{L"", L"a", 90, 3}, {L"", L"b", 11, 2}, {L"", L"c", 10, 1}}, L"ac", L"b", 100},
      {"an empty file after the limit", {{L"", L"a", 100, 2}, {L"", L"b", 0, 1}}, L"ab", L"", 100},
      {"a size that would overflow the sum", {{L"", L"a", 1, 2}, {L"", L"b", UINT64_MAX, 1}}, L"a", L"b", 1},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.what);
    const Selection selection = SelectWithinLimit(row.files, 100);
    EXPECT_EQ(NamesOf(selection.selected), row.selected);
    EXPECT_EQ(NamesOf(selection.skipped), row.skipped);
    EXPECT_EQ(selection.totalSize, row.total);
  }
}

TEST(MakeEntryName, IsRelativeToTheFoldersParent) {
  struct {
    const wchar_t* folder;
    const wchar_t* path;
    const wchar_t* expected;
  } const rows[] = {
      {L"C:\\data\\logs", L"C:\\data\\logs\\x\\y.txt", L"logs/x/y.txt"},
      {L"C:\\data\\logs\\", L"C:\\data\\logs\\y.txt", L"logs/y.txt"},
      {L"C:/data/logs", L"C:/data/logs\\x/y.txt", L"logs/x/y.txt"},
      {L"logs", L"logs\\y", L"logs/y"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(MakeEntryName(L"logs", row.folder, row.path), row.expected) << row.folder;
}

TEST(UnixTimeFromFileTime, CountsSecondsSince1970) {
  EXPECT_EQ(UnixTimeFromFileTime(116'444'736'000'000'000), 0U);
  EXPECT_EQ(UnixTimeFromFileTime(133'444'736'009'999'999), 1'700'000'000U);
}

TEST(PlanJobs, CutsBigFilesAndJoinsSmallOnes) {
  const auto filesOf = [](std::initializer_list<uint64_t> sizes) {
    std::vector<FileRecord> files;
    for (const uint64_t size : sizes)
      files.push_back({L"", L"", size, 0});
    return files;
  };
  const std::vector<FileRecord> files =
      filesOf({10, kRunSize - 10, 1, kPieceSize, kPieceSize + 1, 2 * kPieceSize + 5, 0, 3});
  const std::vector<PackJob> expected = {
      {0, 2, 0, 0, false, false},  // a run that is exactly full
      {2, 1, 0, 0, false, false},
      {3, 1, 0, 0, false, false},  // as big as a piece, but whole
      {4, 1, 0, kPieceSize, true, false},
      {4, 1, kPieceSize, 1, true, true},
      {5, 1, 0, kPieceSize, true, false},
      {5, 1, kPieceSize, kPieceSize, true, false},
      {5, 1, 2 * kPieceSize, 5, true, true},
      {6, 2, 0, 0, false, false},
  };
  EXPECT_EQ(PlanJobs(files), expected);
  EXPECT_TRUE(PlanJobs({}).empty());

  const std::vector<PackJob> many = PlanJobs(std::vector<FileRecord>(kRunFiles + 1));
  ASSERT_EQ(many.size(), 2U);
  EXPECT_EQ(many[1].firstFile, kRunFiles);
}

}  // namespace
}  // namespace stutil
