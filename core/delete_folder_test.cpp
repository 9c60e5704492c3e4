#include "core/delete_folder.h"

#include <gtest/gtest.h>

#include <string>
#include <thread>

#include "core/scoped.h"
#include "tests/support/folder_link.h"
#include "tests/support/test_folder.h"

TEST(DeleteFolder, RemovesTheWholeTree) {
  const TestFolder folder;
  folder.MakeFile(L"tree\\a\\b\\file");
  folder.MakeFile(L"tree\\file");
  folder.MakeFolder(L"tree\\a\\empty");
  folder.MakeFile(L"beside");
  EXPECT_TRUE(DeleteFolder(folder.Path(L"tree\\"), false));
  EXPECT_FALSE(PathExists(folder.Path(L"tree")));
  EXPECT_TRUE(PathExists(folder.Path(L"beside")));
}

TEST(DeleteFolder, ReadOnlyFilesNeedForce) {
  const TestFolder folder;
  for (const wchar_t* name : {L"tree\\a\\read-only", L"tree\\a\\plain"})
    folder.MakeFile(name);
  SetFileAttributesW(folder.Path(L"tree\\a\\read-only").c_str(), FILE_ATTRIBUTE_READONLY | FILE_ATTRIBUTE_HIDDEN);
  EXPECT_FALSE(DeleteFolder(folder.Path(L"tree"), false));
  EXPECT_TRUE(PathExists(folder.Path(L"tree\\a\\read-only")));
  EXPECT_FALSE(PathExists(folder.Path(L"tree\\a\\plain"))) << "the rest goes all the same";
  EXPECT_TRUE(DeleteFolder(folder.Path(L"tree"), true));
  EXPECT_FALSE(PathExists(folder.Path(L"tree")));
}

TEST(DeleteFolder, FileInUseStaysAndEverythingElseGoes) {
  const TestFolder folder;
  const std::wstring held = folder.MakeFile(L"tree\\a\\held");
  folder.MakeFile(L"tree\\a\\free");
  folder.MakeFile(L"tree\\b\\free");
  {
    const KernelHandle file(CreateFileW(held.c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING,
                                        FILE_ATTRIBUTE_NORMAL, nullptr));
    ASSERT_TRUE(file);
    EXPECT_FALSE(DeleteFolder(folder.Path(L"tree"), true));
  }
  EXPECT_TRUE(PathExists(held));
  EXPECT_FALSE(PathExists(folder.Path(L"tree\\a\\free")));
  EXPECT_FALSE(PathExists(folder.Path(L"tree\\b")));
}

TEST(DeleteFolder, WhatIsNoFolderToDeleteIsRefused) {
  const TestFolder folder;
  folder.MakeFile(L"file");
  const CurrentFolder current(folder.Path());
  EXPECT_FALSE(DeleteFolder(L"", true));
  EXPECT_FALSE(DeleteFolder(folder.Path(L"missing"), true));
  EXPECT_FALSE(DeleteFolder(folder.Path(L"file"), true));
  EXPECT_TRUE(PathExists(folder.Path(L"file")));
}

TEST(DeleteFolder, RootsAreRefusedRatherThanEmptied) {
  const TestFolder folder;
  folder.MakeFile(L"kept");
  DefineDosDeviceW(0, L"Q:", folder.Path().c_str());  // a drive whose root is the test's folder
  const bool isDrive = PathExists(L"Q:\\kept");
  for (const wchar_t* root : {L"Q:", L"Q:\\", L"\\\\?\\Q:\\", L"Q:\\folder\\.."})
    EXPECT_FALSE(DeleteFolder(root, true));
  DefineDosDeviceW(DDD_REMOVE_DEFINITION, L"Q:", nullptr);
  EXPECT_TRUE(PathExists(folder.Path(L"kept")));
  if (!isDrive) GTEST_SKIP() << "no drives can be defined here";
}

TEST(DeleteFolder, LinkIsRemovedButNotWhatItLeadsTo) {
  const TestFolder folder;
  folder.MakeFile(L"elsewhere\\kept");
  folder.MakeFile(L"tree\\file");
  const FolderLink link(folder.Path(L"tree\\link"), folder.Path(L"elsewhere"));
  if (!link.Exists()) GTEST_SKIP() << "no links here";
  const FolderLink second(folder.Path(L"second"), folder.Path(L"elsewhere"));
  EXPECT_EQ(DeleteFolder(folder.Path(L"second"), true), link.IsRemovable());
  EXPECT_EQ(DeleteFolder(folder.Path(L"tree"), true), link.IsRemovable());
  EXPECT_EQ(PathExists(folder.Path(L"tree")), !link.IsRemovable());
  EXPECT_FALSE(PathExists(folder.Path(L"tree\\file")));
  EXPECT_TRUE(PathExists(folder.Path(L"elsewhere\\kept")));
}

TEST(DeleteFolder, AFolderThatSomebodyLooksAtGoesWhenHeLooksAway) {
  const TestFolder folder;
  folder.MakeFile(L"tree\\a\\b\\file");
  WIN32_FIND_DATAW entry;
  FindHandle look(FindFirstFileW(folder.Path(L"tree\\a\\*").c_str(), &entry));
  ASSERT_TRUE(look);
  std::thread onlooker([&look] {
    Sleep(150);
    look.Reset();
  });
  EXPECT_TRUE(DeleteFolder(folder.Path(L"tree"), false));
  onlooker.join();
  EXPECT_FALSE(PathExists(folder.Path(L"tree")));
}

TEST(DeleteFolder, DeepTreeGoes) {
  const TestFolder folder;
  std::wstring name = L"deep";
  for (int level = 0; level < 250; ++level)
    name += L"\\d";
  folder.MakeFile(name + L"\\file");
  EXPECT_TRUE(DeleteFolder(folder.Path(L"deep"), false));
  EXPECT_FALSE(PathExists(folder.Path(L"deep")));
}
