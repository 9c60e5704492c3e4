#include "core/paths.h"

#include <gtest/gtest.h>

#include <string>

TEST(JoinPath, PutsExactlyOneSeparatorBetween) {
  struct {
    const wchar_t* base;
    const wchar_t* part;
    const wchar_t* expected;
  } const rows[] = {
      {L"C:\\a", L"b", L"C:\\a\\b"},
      {L"C:\\a\\", L"b", L"C:\\a\\b"},
      {L"C:/a/", L"b", L"C:/a/b"},
      {L"C:\\a", L"\\/\\b\\c", L"C:\\a\\b\\c"},
      {L"C:\\a\\", L"//b", L"C:\\a\\b"},
      {L"", L"b", L"b"},
      {L"", L"\\b", L"b"},
      {L"C:\\a", L"", L"C:\\a\\"},
      {L"C:\\a", L"\\\\", L"C:\\a\\"},
      {L"\\\\", L"b", L"\\\\b"},  // what the base already ends in stays
      {L"", L"", L""},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(std::wstring(JoinPath(row.base, row.part)), row.expected) << row.base << " + " << row.part;
  }
}

TEST(PathParts, LieOnBothSidesOfTheLastSeparator) {
  struct {
    const wchar_t* path;
    const wchar_t* parent;
    const wchar_t* last;  // separators at the end do not count
  } const rows[] = {
      {L"C:\\a\\b.txt", L"C:\\a", L"b.txt"},
      {L"C:/a/b", L"C:/a", L"b"},
      {L"b", L"", L"b"},
      {L"C:\\a\\b\\/", L"C:\\a\\b\\", L"b"},
      {L"C:\\", L"C:", L"C:"},
      {L"\\", L"", L""},
      {L"", L"", L""},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(ParentFolder(row.path), row.parent) << row.path;
    EXPECT_EQ(LastPathComponent(row.path), row.last) << row.path;
  }
}

TEST(EqualNames, IgnoresTheCaseOfAllLetters) {
  EXPECT_TRUE(EqualNames(L"\u00c4b.TXT", L"\u00e4B.txt"));
  EXPECT_FALSE(EqualNames(L"a", L"ab"));
  EXPECT_FALSE(EqualNames(L"a", L"\u00e4"));
}

TEST(IsAbsolutePath, NeedsADriveWithItsRootOrAServer) {
  for (const wchar_t* path : {L"C:\\", L"c:/x", L"\\\\server\\share", L"//server/share", L"\\\\?\\C:\\x"})
    EXPECT_TRUE(IsAbsolutePath(path)) << path;
  for (const wchar_t* path : {L"", L"x", L"C:", L"C:x", L"\\x", L".\\x", L"%x%\\y"})
    EXPECT_FALSE(IsAbsolutePath(path)) << path;
}

TEST(IsVolumeRoot, KnowsDrivesVolumesAndShares) {
  struct {
    const wchar_t* path;
    bool isRoot;
  } const rows[] = {
      {L"\\\\?\\C:\\", true},
      {L"\\\\?\\C:", true},
      {L"\\\\?\\C:\\a", false},
      {L"\\\\?\\C:\\a\\", false},
      {L"\\\\?\\Volume{4c1b02c1-d990-11dc-99ae-806e6f6e6963}\\", true},
      {L"\\\\?\\UNC\\server\\share", true},
      {L"\\\\?\\UNC\\server\\share\\", true},
      {L"\\\\?\\UNC\\server\\share\\a", false},
      {L"\\\\?\\", true},
      {L"", true},
  };
  for (const auto& row : rows)
    EXPECT_EQ(IsVolumeRoot(row.path), row.isRoot) << row.path;
}

TEST(FolderContains, IsTrueForTheFolderAndWhatLiesInIt) {
  struct {
    const wchar_t* outer;
    const wchar_t* inner;
    bool expected;
  } const rows[] = {
      {L"C:\\Logs", L"C:\\Logs", true},
      {L"C:\\Logs", L"c:\\LOGS\\", true},
      {L"C:\\Logs\\", L"C:\\Logs\\deep\\er", true},
      {L"C:\\", L"C:\\Logs", true},
      {L"C:\\Logs", L"C:\\Logs2", false},
      {L"C:\\Logs", L"C:\\", false},
      {L"C:\\Logs\\deep", L"C:\\Logs", false},
      {L"D:\\Logs", L"C:\\Logs", false},
  };
  for (const auto& row : rows)
    EXPECT_EQ(FolderContains(row.outer, row.inner), row.expected) << row.outer << " and " << row.inner;
}
