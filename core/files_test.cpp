#include "core/files.h"

#include <gtest/gtest.h>

#include <string>

#include "core/scoped.h"
#include "tests/support/test_folder.h"

namespace {

constexpr uint64_t kNoLimit = UINT64_MAX;

std::string Content(const std::wstring& path) {
  std::string bytes;
  EXPECT_EQ(ReadWholeFile(path, kNoLimit, bytes), ERROR_SUCCESS) << path;
  return bytes;
}

KernelHandle Hold(const std::wstring& path, DWORD share) {
  return KernelHandle(CreateFileW(ExtendedPath(path).c_str(), GENERIC_READ, share, nullptr, OPEN_EXISTING,
                                  FILE_ATTRIBUTE_NORMAL, nullptr));
}

}  // namespace

TEST(ExtendPath, EveryKindOfPath) {
  struct {
    const wchar_t* path;
    const wchar_t* expected;
  } const rows[] = {
      {L"", L""},
      {L"C:\\a\\b", L"\\\\?\\C:\\a\\b"},
      {L"C:/a//b/", L"\\\\?\\C:\\a\\b"},
      {L"C:\\a\\.\\b\\..\\c", L"\\\\?\\C:\\a\\c"},
      {L"C:\\..\\..\\a", L"\\\\?\\C:\\a"},
      {L"C:\\", L"\\\\?\\C:\\"},
      {L"C:\\dots...", L"\\\\?\\C:\\dots..."},
      {L"collected", L"\\\\?\\D:\\work\\collected"},
      {L"..\\collected", L"\\\\?\\D:\\collected"},
      {L"\\top", L"\\\\?\\D:\\top"},
      {L"\\\\server\\share\\x", L"\\\\?\\UNC\\server\\share\\x"},
      {L"\\\\?\\C:\\kept\\..\\as it is", L"\\\\?\\C:\\kept\\..\\as it is"},
      {L"\\\\.\\pipe\\x", L"\\\\.\\pipe\\x"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(ExtendPath(row.path, L"D:\\work"), row.expected) << row.path;
}

TEST(ExtendedPath, ResolvesAgainstTheCurrentFolderOfTheDrive) {
  const TestFolder folder;
  const CurrentFolder current(folder.Path());
  const std::wstring drive = folder.Path().substr(0, 2);
  EXPECT_EQ(ExtendedPath(L"name"), ExtendedPath(folder.Path(L"name")));
  EXPECT_EQ(ExtendedPath(drive + L"name"), ExtendedPath(folder.Path(L"name")));
  EXPECT_EQ(ExtendedPath(L"\\name"), L"\\\\?\\" + drive + L"\\name");
}

TEST(ReadWholeFile, LimitIsInclusiveAndNothingIsReadBeyond) {
  const TestFolder folder;
  const std::wstring path = folder.MakeFile(L"ten", "0123456789");
  std::string bytes = "before";
  EXPECT_EQ(ReadWholeFile(path, 9, bytes), static_cast<DWORD>(ERROR_FILE_TOO_LARGE));
  EXPECT_EQ(bytes, "before");
  EXPECT_EQ(ReadWholeFile(path, 10, bytes), ERROR_SUCCESS);
  EXPECT_EQ(bytes, "0123456789");
  EXPECT_EQ(ReadWholeFile(folder.Path(L"missing"), 10, bytes), static_cast<DWORD>(ERROR_FILE_NOT_FOUND));
  EXPECT_NE(ReadWholeFile(folder.Path(), 10, bytes), ERROR_SUCCESS) << "a folder is no file";
  EXPECT_EQ(Content(folder.MakeFile(L"empty")), "");
}

TEST(ShownPath, IsThePathWithoutThePrefix) {
  EXPECT_EQ(ShownPath(L"\\\\?\\C:\\a"), L"C:\\a");
  EXPECT_EQ(ShownPath(L"\\\\?\\UNC\\server\\share\\a"), L"\\\\server\\share\\a");
  EXPECT_EQ(ShownPath(L"\\\\?\\Volume{1}\\a"), L"\\\\?\\Volume{1}\\a");
  for (const wchar_t* other : {L"C:\\a", L"a", L"", L"\\\\server\\share", L"\\\\?"})
    EXPECT_EQ(ShownPath(other), other);
}

TEST(WriteWholeFile, ReplacesTheFileAndLeavesNoPartialOne) {
  const TestFolder folder;
  const std::wstring path = folder.Path(L"file");
  const std::string binary("a\0\r\n\x1A\xFF", 6);
  for (const std::string& bytes : {std::string(100'000, 'x'), binary, std::string()}) {
    EXPECT_EQ(WriteWholeFile(path, bytes), ERROR_SUCCESS);
    EXPECT_EQ(Content(path), bytes);
    EXPECT_FALSE(PathExists(path + kPartialSuffix));
  }
}

TEST(WriteWholeFile, FailureKeepsTheOldFileAndLeavesNoPartialOne) {
  const TestFolder folder;
  const std::wstring path = folder.MakeFile(L"file", "old");
  {
    const KernelHandle held = Hold(path, FILE_SHARE_READ);
    ASSERT_TRUE(held);
    EXPECT_NE(WriteWholeFile(path, std::string_view("new")), ERROR_SUCCESS);
    EXPECT_EQ(Content(path), "old");
  }
  EXPECT_FALSE(PathExists(path + kPartialSuffix));
  EXPECT_EQ(WriteWholeFile(folder.Path(L"missing\\file"), std::string_view("x")),
            static_cast<DWORD>(ERROR_PATH_NOT_FOUND));
  folder.MakeFolder(L"folder");
  EXPECT_NE(WriteWholeFile(folder.Path(L"folder"), std::string_view("x")), ERROR_SUCCESS);
  EXPECT_FALSE(PathExists(folder.Path(L"folder") + kPartialSuffix));
}

TEST(Files, LongPathsAndTrailingDotsAreKept) {
  const TestFolder folder;
  const std::wstring name(150, L'n');
  const std::wstring deep = folder.MakeFile(name + L"\\" + name + L"\\file", "deep");
  ASSERT_GT(deep.size(), 300u);
  EXPECT_EQ(Content(deep), "deep");

  // "name" and "name." are two files.
  folder.MakeFile(L"name", "without");
  folder.MakeFile(L"name.", "with");
  EXPECT_EQ(Content(folder.Path(L"name")), "without");
  EXPECT_EQ(Content(folder.Path(L"name.")), "with");
}

TEST(Files, ExistenceTellsFilesFromFolders) {
  const TestFolder folder;
  const std::wstring file = folder.MakeFile(L"file");
  EXPECT_TRUE(PathExists(file) && PathExists(folder.Path()) && FolderExists(folder.Path()));
  EXPECT_FALSE(FolderExists(file) || PathExists(folder.Path(L"missing")) || FolderExists(folder.Path(L"missing")));
  EXPECT_FALSE(PathExists(L"") || FolderExists(L""));
}

TEST(Files, OnlyWhatTheSystemCallsMissingIsAbsent) {
  const TestFolder folder;
  EXPECT_TRUE(IsAbsent(folder.Path(L"missing")) && IsAbsent(folder.Path(L"no\\parent")));
  EXPECT_FALSE(IsAbsent(folder.Path()) || IsAbsent(folder.MakeFile(L"file")));
  EXPECT_FALSE(IsAbsent(folder.Path(L"a|b<c>?")));  // no name at all: the system answers with another error
}
