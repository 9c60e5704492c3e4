#include "report/extraction.h"

#include <gmock/gmock.h>

#include <set>

#include "core/text.h"
#include "core/walk_dir.h"
#include "tests/support/crafted_zip.h"
#include "tests/support/test_folder.h"

namespace report {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

std::set<std::string> Below(const std::wstring& folder) {
  std::set<std::string> names;
  WalkDir(folder, [&](const qx::PathString& path, const WIN32_FIND_DATAW&) {
    names.insert(ToUtf8(std::wstring_view(path).substr(folder.size() + 1)));
    return kWalkContinue;
  });
  return names;
}

std::string Content(const std::wstring& path) {
  std::string bytes;
  return ReadWholeFile(path, 1 << 20, bytes) == ERROR_SUCCESS ? bytes : "cannot be read";
}

std::vector<Evidence> Extract(const std::vector<CraftedEntry>& entries, const std::wstring& folder) {
  const std::string bytes = CraftZip(entries);
  std::string error;
  const auto archive = Archive::Open(bytes, error);
  EXPECT_NE(archive, nullptr) << error;
  return ExtractArchive(*archive, folder);
}

TEST(Extraction, FilesAndFoldersAreMade) {
  const TestFolder folder;
  const std::wstring out = folder.Path(L"new\\out");
  EXPECT_EQ(PrepareFolder(out), "");
  EXPECT_THAT(Extract({{"collected/a.json", "{}"}, {"empty/", ""}, {"x\xC3\xB6", "1"}}, out), IsEmpty());
  EXPECT_THAT(Below(out), ElementsAre("collected", "collected\\a.json", "empty", "x\xC3\xB6"));
  EXPECT_EQ(Content(out + L"\\collected\\a.json"), "{}");
}

TEST(Extraction, NothingIsWrittenOutsideTheFolder) {
  const TestFolder folder;
  const std::wstring out = folder.MakeFolder(L"out");
  Extract({{"../a", "x"},
           {"..\\b", "x"},
           {"a/../../c", "x"},
           {"/d", "x"},
           {"C:/st_report_e", "x"},
           {"link", "..", 0120777u << 16},
           {"link/f", "x"},
           {"NUL", "x"},
           {"g:stream", "x"},
           {"good", "x"}},
          out);
  EXPECT_THAT(Below(folder.Path()), ElementsAre("out", "out\\good", "out\\link", "out\\link\\f"));
  EXPECT_FALSE(PathExists(L"C:\\st_report_e"));
}

TEST(Extraction, NoEntryReplacesAnother) {
  const TestFolder folder;
  const std::wstring& out = folder.Path();
  // A file that is a folder too; one whose name differs by a case that only the file system folds; and the name under
  // which another one is written.
  const auto failures = Extract({{"\xC3\x96", "second"},
                                 {"\xC3\xB6", "first"},
                                 {"x.partial", "partial"},
                                 {"x", "whole"},
                                 {"f/g", "g"},
                                 {"f", "f"}},
                                out);
  EXPECT_EQ(Content(out + L"\\x.partial"), "partial");
  EXPECT_EQ(Content(out + L"\\x"), "whole");
  EXPECT_EQ(Content(out + L"\\f"), "f");
  EXPECT_EQ(Content(out + L"\\\u00D6"), "second");
  EXPECT_THAT(failures, ElementsAre(testing::Field(&Evidence::file, "f/g"),
                                    Evidence{"\xC3\xB6", "", "another entry has the name"}));
}

TEST(Extraction, OnlyAnEmptyFolderIsTaken) {
  const TestFolder folder;
  EXPECT_EQ(PrepareFolder(folder.Path()), "");
  const std::wstring file = folder.MakeFile(L"file");
  EXPECT_THAT(PrepareFolder(folder.Path()), HasSubstr("is not empty"));
  EXPECT_THAT(PrepareFolder(file), HasSubstr("cannot be made"));
}

}  // namespace
}  // namespace report
