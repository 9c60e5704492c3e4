#include "core/walk_dir.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <set>
#include <string>

#include "core/folder_entries.h"
#include "tests/support/folder_link.h"
#include "tests/support/test_folder.h"

namespace {

using Names = std::set<std::wstring>;

// What a walk visits, without the root; `answer` is given for every folder.
Names Walked(const std::wstring& root, WalkDir_Ret answer = kWalkContinue) {
  Names names;
  EXPECT_TRUE(WalkDir(root, [&](const qx::PathString& path, const WIN32_FIND_DATAW& entry) {
    EXPECT_TRUE(names.insert(std::wstring(path).substr(root.size() + 1)).second) << path.c_str() << " visited twice";
    return IsFolder(entry) ? answer : kWalkContinue;
  }));
  return names;
}

}  // namespace

TEST(WalkDir, VisitsFilesAndFoldersOfTheWholeTree) {
  const TestFolder folder;
  folder.MakeFile(L"top.txt");
  folder.MakeFile(L"a\\b\\deep.txt");
  folder.MakeFolder(L"a\\empty");
  const Names everything{L"top.txt", L"a", L"a\\b", L"a\\b\\deep.txt", L"a\\empty"};
  EXPECT_EQ(Walked(folder.Path()), everything);
  EXPECT_EQ(Walked(folder.Path(), kWalkSkip), (Names{L"top.txt", L"a"})) << "skipped folders are not walked into";
  EXPECT_EQ(Walked(folder.Path(), static_cast<WalkDir_Ret>(7)), everything) << "any other answer means go on";
}

TEST(WalkDir, PathsAreTheRootAsGivenJoinedWithNames) {
  const TestFolder folder;
  folder.MakeFile(L"file");
  std::wstring withSlashes = folder.Path() + L"/";
  std::replace(withSlashes.begin(), withSlashes.end(), L'\\', L'/');
  const CurrentFolder current(folder.Path());
  for (const std::wstring& root : {folder.Path() + L"\\", withSlashes, std::wstring(L".\\")}) {
    EXPECT_TRUE(WalkDir(root, [&](const qx::PathString& path, WIN32_FIND_DATAW entry) {
      EXPECT_EQ(std::wstring(path), root + L"file");
      EXPECT_STREQ(entry.cFileName, L"file");
      return kWalkContinue;
    }));
  }
}

TEST(WalkDir, BothFormsTellTheAttributesAndTheRecordTheSize) {
  const TestFolder folder;
  folder.MakeFile(L"five", "12345");
  SetFileAttributesW(folder.Path(L"five").c_str(), FILE_ATTRIBUTE_READONLY);
  DWORD fromRecord = 0;
  uint32_t fromSecondForm = 0;
  WalkDir(folder.Path(), [&](const qx::PathString&, WIN32_FIND_DATAW entry) {
    EXPECT_EQ(entry.nFileSizeLow, 5u);
    fromRecord = entry.dwFileAttributes;
    return kWalkContinue;
  });
  WalkDir(folder.Path(), [&](const qx::PathString&, uint32_t attributes) {
    fromSecondForm = attributes;
    return kWalkContinue;
  });
  EXPECT_TRUE(fromRecord & FILE_ATTRIBUTE_READONLY);
  EXPECT_EQ(fromSecondForm, fromRecord);
}

TEST(WalkDir, StopEndsTheWalkAtOnceAndIsNoFailure) {
  const TestFolder folder;
  for (const wchar_t* name : {L"a\\1", L"b\\2", L"c\\3"})
    folder.MakeFile(name);
  int calls = 0;
  EXPECT_TRUE(WalkDir(folder.Path(), [&](const qx::PathString&, uint32_t) {
    return ++calls == 2 ? kWalkStop : kWalkContinue;  // one folder is pending by then
  }));
  EXPECT_EQ(calls, 2);
}

TEST(WalkDir, FalseWhenTheRootCannotBeListed) {
  const TestFolder folder;
  const std::wstring file = folder.MakeFile(L"file");
  for (const std::wstring& root : {std::wstring(), folder.Path(L"missing"), file}) {
    EXPECT_FALSE(WalkDir(root, [](const qx::PathString& path, uint32_t) {
      ADD_FAILURE() << path.c_str();
      return kWalkStop;
    })) << root;
  }
  EXPECT_EQ(Walked(folder.MakeFolder(L"empty")), Names{});
}

TEST(WalkDir, FolderThatVanishesDuringTheWalkIsPassedOver) {
  const TestFolder folder;
  folder.MakeFile(L"gone\\file");
  folder.MakeFile(L"stays\\file");
  Names names;
  EXPECT_TRUE(WalkDir(folder.Path(), [&](const qx::PathString& path, uint32_t) {
    DeleteFolder(folder.Path(L"gone"), true);
    names.emplace(LastPathComponent(path));
    return kWalkContinue;
  }));
  EXPECT_TRUE(names.contains(L"stays") && names.contains(L"file"));
}

TEST(WalkDir, LongPathsAndNamesThatEndInADotAreReached) {
  const TestFolder folder;
  const std::wstring name(100, L'n');
  const std::wstring deep = name + L"\\" + name + L"\\" + name + L"\\" + name;
  folder.MakeFile(deep + L"\\file");
  const Names names = Walked(folder.Path());
  EXPECT_TRUE(names.contains(deep + L"\\file"));
  EXPECT_EQ(names.size(), 5u);

  folder.MakeFile(L"dotted.\\inside");
  EXPECT_TRUE(Walked(folder.Path()).contains(L"dotted.\\inside"));
}

TEST(WalkDir, LinksAreVisitedButNotEntered) {
  const TestFolder folder;
  folder.MakeFile(L"a\\file");
  const FolderLink loop(folder.Path(L"a\\loop"), folder.Path());
  if (!loop.Exists()) GTEST_SKIP() << "no links here";
  EXPECT_EQ(Walked(folder.Path()), (Names{L"a", L"a\\file", L"a\\loop"}));
  EXPECT_EQ(Walked(folder.Path(L"a\\loop")), (Names{L"a", L"a\\file", L"a\\loop"})) << "a link as the root is walked";
}

TEST(FolderEntries, LinksAndFoldersWithoutATagAreNotOfTheTree) {
  constexpr DWORD kFolder = FILE_ATTRIBUTE_DIRECTORY;
  constexpr DWORD kReparse = FILE_ATTRIBUTE_DIRECTORY | FILE_ATTRIBUTE_REPARSE_POINT;
  constexpr DWORD kCloudTag = 0x9000001A;
  struct {
    DWORD attributes;
    DWORD tag;
    bool isFolderOfTree;
    bool isLink;
  } const rows[] = {
      {kFolder, 0, true, false},
      {kFolder, IO_REPARSE_TAG_SYMLINK, true, false},  // not a reparse point: the field means nothing
      {kReparse, IO_REPARSE_TAG_SYMLINK, false, true},
      {kReparse, IO_REPARSE_TAG_MOUNT_POINT, false, true},
      {kReparse, 0, false, false},
      {kReparse, kCloudTag, true, false},
      {FILE_ATTRIBUTE_ARCHIVE, 0, false, false},
      {FILE_ATTRIBUTE_REPARSE_POINT, kCloudTag, false, false},
      {FILE_ATTRIBUTE_REPARSE_POINT, IO_REPARSE_TAG_SYMLINK, false, true},
  };
  for (const auto& row : rows) {
    WIN32_FIND_DATAW entry{};
    entry.dwFileAttributes = row.attributes;
    entry.dwReserved0 = row.tag;
    EXPECT_EQ(IsFolderOfTree(entry), row.isFolderOfTree) << row.attributes << ' ' << row.tag;
    EXPECT_EQ(IsLink(entry), row.isLink) << row.attributes << ' ' << row.tag;
  }
}
