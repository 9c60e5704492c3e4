#include "companions/crash/dump_folder.h"

#include <gtest/gtest.h>

#include "core/files.h"
#include "core/scoped.h"
#include "tests/support/test_folder.h"

namespace {

// Written at the hour `age` of one day, whenever that was.
std::wstring MakeDump(const TestFolder& folder, const std::wstring& name, WORD age) {
  const std::wstring path = folder.MakeFile(name, "dump");
  const SYSTEMTIME written{2031, 1, 0, 2, age, 0, 0, 0};
  FILETIME time;
  SystemTimeToFileTime(&written, &time);
  const KernelHandle file(CreateFileW(ExtendedPath(path).c_str(), FILE_WRITE_ATTRIBUTES, FILE_SHARE_READ, nullptr,
                                      OPEN_EXISTING, 0, nullptr));
  EXPECT_TRUE(SetFileTime(file.Get(), nullptr, nullptr, &time));
  return ExtendedPath(path);
}

}  // namespace

TEST(DumpFolder, IsMadeWithItsParents) {
  const TestFolder folder;
  const std::wstring dumps = ExtendedPath(folder.Path(L"a\\b\\dumps"));
  for (int i = 0; i < 2; ++i) {  // the second time it is there already
    const crash::PreparedFolder prepared = crash::PrepareFolder(dumps, 5);
    EXPECT_EQ(prepared.error, 0u);
    EXPECT_EQ(prepared.surplus, L"");
    EXPECT_TRUE(FolderExists(dumps));
  }
}

TEST(DumpFolder, TheOldestBeyondTheLimitGoAndTheNextToGoIsNamed) {
  const TestFolder folder;
  const std::wstring middle = MakeDump(folder, L"a_1_20310102-030405.dmp", 3);
  const std::wstring oldest = MakeDump(folder, L"z_1_20310102-030405.dmp", 2);
  const std::wstring newest = MakeDump(folder, L"m_1_20310102-030405.dmp", 4);
  const std::wstring foreign = MakeDump(folder, L"notepad_1234.dmp", 1);
  const std::wstring unfinished = MakeDump(folder, L"a_1_20310102-030405.dmp.partial", 5);
  const std::wstring path = ExtendedPath(folder.Path());

  EXPECT_EQ(crash::PrepareFolder(path, 4).surplus, L"");
  EXPECT_FALSE(PathExists(unfinished));
  EXPECT_EQ(crash::PrepareFolder(path, 3).surplus, oldest);
  EXPECT_TRUE(PathExists(oldest));
  EXPECT_EQ(crash::PrepareFolder(path, 2).surplus, middle);
  EXPECT_FALSE(PathExists(oldest));
  EXPECT_EQ(crash::PrepareFolder(path, 1).surplus, newest);
  EXPECT_FALSE(PathExists(middle));
  EXPECT_TRUE(PathExists(newest));
  EXPECT_TRUE(PathExists(foreign));
}

TEST(DumpFolder, ADumpThatIsBeingWrittenStays) {
  const TestFolder folder;
  const std::wstring path = ExtendedPath(folder.Path(L"a_1_20310102-030405.dmp.partial"));
  const KernelHandle writer(CreateFileW(path.c_str(), GENERIC_WRITE, 0, nullptr, CREATE_ALWAYS, 0, nullptr));
  EXPECT_EQ(crash::PrepareFolder(ExtendedPath(folder.Path()), 5).error, 0u);
  EXPECT_TRUE(PathExists(path));
}

TEST(DumpFolder, APlaceWhereNoFolderCanBeIsAnError) {
  const TestFolder folder;
  const std::wstring file = folder.MakeFile(L"file");
  EXPECT_NE(crash::PrepareFolder(ExtendedPath(file), 5).error, 0u);
  EXPECT_NE(crash::PrepareFolder(ExtendedPath(file + L"\\below"), 5).error, 0u);
}
