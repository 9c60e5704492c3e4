#include "core/delete_folder.h"

#include <gtest/gtest.h>

#include <string>

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
  std::wstring before(GetCurrentDirectoryW(0, nullptr), L'\0');
  before.resize(GetCurrentDirectoryW(static_cast<DWORD>(before.size()), before.data()));
  SetCurrentDirectoryW(folder.Path().c_str());
  EXPECT_FALSE(DeleteFolder(L"", true));
  SetCurrentDirectoryW(before.c_str());
  EXPECT_FALSE(DeleteFolder(folder.Path(L"missing"), true));
  EXPECT_FALSE(DeleteFolder(folder.Path(L"file"), true));
  EXPECT_TRUE(PathExists(folder.Path(L"file")));
}

TEST(DeleteFolder, RootsAreRefusedRatherThanEmptied) {
  const TestFolder folder;
  // A drive whose root is the test's folder.
  ASSERT_TRUE(DefineDosDeviceW(0, L"Q:", folder.Path().c_str()));
  folder.MakeFile(L"kept");
  folder.MakeFile(L"tree\\file");
  for (const wchar_t* root : {L"Q:", L"Q:\\", L"q:/", L"\\\\?\\Q:\\", L"Q:\\tree\\.."}) {
    EXPECT_FALSE(DeleteFolder(root, true)) << root;
  }
  EXPECT_TRUE(PathExists(folder.Path(L"kept")));
  EXPECT_TRUE(DeleteFolder(L"Q:\\tree", true));
  DefineDosDeviceW(DDD_REMOVE_DEFINITION, L"Q:", nullptr);
  EXPECT_FALSE(PathExists(folder.Path(L"tree")));
}

TEST(DeleteFolder, LinkIsRemovedButNotWhatItLeadsTo) {
  const TestFolder folder;
  folder.MakeFile(L"elsewhere\\kept");
  folder.MakeFile(L"tree\\file");
  if (!folder_link::Make(folder.Path(L"tree\\link"), folder.Path(L"elsewhere"))) GTEST_SKIP() << "no links here";
  EXPECT_TRUE(DeleteFolder(folder.Path(L"tree"), true));
  EXPECT_FALSE(PathExists(folder.Path(L"tree")));
  EXPECT_TRUE(PathExists(folder.Path(L"elsewhere\\kept")));
}

TEST(DeleteFolder, DeepTreeGoes) {
  const TestFolder folder;
  std::wstring name = L"deep";
  for (int level = 0; level < 250; ++level) name += L"\\d";
  folder.MakeFile(name + L"\\file");
  EXPECT_TRUE(DeleteFolder(folder.Path(L"deep"), false));
  EXPECT_FALSE(PathExists(folder.Path(L"deep")));
}
