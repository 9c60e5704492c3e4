#include "app/folders_to_pack.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "core/files.h"
#include "core/logging.h"
#include "tests/support/temporary_folder_at.h"
#include "tests/support/test_folder.h"

namespace {

std::string Content(const std::wstring& path) {
  std::string bytes;
  return ReadWholeFile(path, 1 << 20, bytes) == ERROR_SUCCESS ? bytes : "(absent)";
}

}  // namespace

TEST(GetFoldersToCopy, TakesTheFoldersOfTheListInItsOrder) {
  struct {
    const char* list;
    std::vector<std::wstring> folders;
    size_t errors;
  } const rows[] = {
      {R"(["C:\\b", "C:\\a"])", {L"C:\\b", L"C:\\a"}, 0},
      {"[\"C:\\\\S\\u00fcd\"]", {L"C:\\S\u00fcd"}, 0},
      {"[]", {}, 0},
      {R"([1, "C:\\a", null, {}, ["x"], "", "C:\\x\u0000y"])", {L"C:\\a"}, 6},
      {R"({"a": "C:\\a"})", {}, 1},
      {R"("C:\\a")", {}, 1},
      {"", {}, 2},
      {"[\"C:\\\\a\"", {}, 2},
  };
  for (const auto& row : rows) {
    const TestFolder folder;
    folder.MakeFile(L"log_folders_considered.json", row.list);
    logging::ErrorCapture errors;
    EXPECT_EQ(st::GetFoldersToCopy(folder.Path()), row.folders) << row.list;
    EXPECT_EQ(errors.Take().size(), row.errors) << row.list;
  }
}

TEST(GetFoldersToCopy, AbsentListIsNoErrorAndAHugeOneIsRefused) {
  const TestFolder folder;
  logging::ErrorCapture errors;
  EXPECT_TRUE(st::GetFoldersToCopy(folder.Path()).empty());
  EXPECT_TRUE(errors.Take().empty());
  folder.MakeFile(L"log_folders_considered.json", "[\"a\"" + std::string(2 << 20, ' ') + "]");
  EXPECT_TRUE(st::GetFoldersToCopy(folder.Path()).empty());
  EXPECT_EQ(errors.Take().size(), 1u);
}

TEST(CopyInstallLogs, TakesEveryInstallerFileBelowTheTemporaryFolder) {
  const TestFolder temporary;
  const TemporaryFolderAt here(temporary.Path());
  temporary.MakeFile(L"qxinst.1.log", "one");
  temporary.MakeFile(L"deep\\er\\a.qxinst.txt", "two");
  temporary.MakeFile(L"qxinst.folder\\inside.txt", "three");  // the whole path counts
  temporary.MakeFile(L"QXINST.log", "other case");
  temporary.MakeFile(L"qxinst", "no dot");
  temporary.MakeFile(L"out\\qxinst.own.log", "of the output folder");
  temporary.MakeFile(L"out\\install_logs\\left.log", "of an earlier run");

  logging::ErrorCapture errors;
  const std::wstring target = st::CopyInstallLogs(temporary.Path(L"out"));
  ASSERT_EQ(target, temporary.Path(L"out\\install_logs"));
  EXPECT_EQ(Content(target + L"\\qxinst.1.log"), "one");
  EXPECT_EQ(Content(target + L"\\a.qxinst.txt"), "two");
  EXPECT_EQ(Content(target + L"\\inside.txt"), "three");
  for (const wchar_t* absent : {L"\\QXINST.log", L"\\qxinst", L"\\qxinst.own.log", L"\\left.log", L"\\qxinst.folder"}) {
    EXPECT_FALSE(PathExists(target + absent)) << absent;
  }
  const std::vector<std::wstring> lines = errors.Take();  // the folder cannot be copied as a file
  ASSERT_EQ(lines.size(), 1u);
  EXPECT_EQ(lines[0], L"st::CopyInstallLogs: Failed to copy file from " + temporary.Path(L"qxinst.folder") + L" to " +
                          target + L"\\qxinst.folder ");
}

TEST(CopyInstallLogs, WithoutAnOutputFolderThereIsNoPath) {
  const TestFolder folder;
  logging::ErrorCapture errors;
  EXPECT_EQ(st::CopyInstallLogs(folder.Path(L"absent")), L"");
  EXPECT_EQ(errors.Take(), std::vector<std::wstring>{L"st::CopyInstallLogs: can't create install logs folder"});
}
