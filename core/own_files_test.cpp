#include "core/own_files.h"

#include <gtest/gtest.h>

#include <string>

#include "core/files.h"
#include "tests/support/test_folder.h"

namespace {

std::string ContentOf(const std::wstring& path) {
  std::string bytes;
  return ReadWholeFile(path, 1'000'000, bytes) == ERROR_SUCCESS ? bytes : "(unreadable)";
}

// A file of somebody else's, and another name of it planted where something is about to be written.
struct PlantedLink {
  explicit PlantedLink(const std::wstring& name) : path(folder.Path(name)) {
    if (!CreateHardLinkW(path.c_str(), victim.c_str(), nullptr)) throw std::runtime_error("no link for the test");
  }
  TestFolder folder;
  std::wstring victim = folder.MakeFile(L"victim", "precious");
  std::wstring path;
};

void Write(const KernelHandle& file, std::string_view bytes) {
  DWORD written = 0;
  EXPECT_TRUE(WriteFile(file.Get(), bytes.data(), static_cast<DWORD>(bytes.size()), &written, nullptr));
}

TEST(OwnFiles, WholeFileIsNeverWrittenThroughALinkUnderEitherOfItsNames) {
  for (const wchar_t* name : {L"out.json", L"out.json.partial"}) {
    const PlantedLink link(name);
    EXPECT_EQ(WriteWholeFile(link.folder.Path(L"out.json"), std::string_view("collected")), ERROR_SUCCESS);
    EXPECT_EQ(ContentOf(link.folder.Path(L"out.json")), "collected");
    EXPECT_EQ(ContentOf(link.victim), "precious") << name;
  }
}

TEST(OwnFiles, FreshFileTakesThePlaceOfWhatCanBeDeleted) {
  const PlantedLink link(L"fresh");
  Write(CreateFreshFile(link.path.c_str(), GENERIC_WRITE, 0), "new");
  EXPECT_EQ(ContentOf(link.path), "new");
  EXPECT_EQ(ContentOf(link.victim), "precious");
  EXPECT_FALSE(CreateFreshFile(link.folder.MakeFolder(L"folder").c_str(), GENERIC_WRITE, 0));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ACCESS_DENIED));
  EXPECT_FALSE(CreateFreshFile(link.folder.Path(L"no\\folder").c_str(), GENERIC_WRITE, 0));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_PATH_NOT_FOUND));
}

TEST(OwnFiles, AppendingContinuesAFileButNeverALinkedOne) {
  const PlantedLink link(L"log");
  EXPECT_FALSE(OpenForAppending(link.path.c_str(), 0));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_TOO_MANY_LINKS));
  EXPECT_EQ(ContentOf(link.victim), "precious");
  const std::wstring own = link.folder.Path(L"own");
  for (const char* line : {"one ", "two"})
    Write(OpenForAppending(own.c_str(), 0), line);
  EXPECT_EQ(ContentOf(own), "one two");
}

TEST(OwnFiles, CopyIsFreshAndWholeOrNotThere) {
  const PlantedLink link(L"copy");
  const std::string content(1'000'000, 'x');
  const std::wstring source = link.folder.MakeFile(L"source", content);
  EXPECT_EQ(CopyToFreshFile(source.c_str(), link.path.c_str()), ERROR_SUCCESS);
  EXPECT_EQ(ContentOf(link.path), content);
  EXPECT_EQ(ContentOf(link.victim), "precious");
  EXPECT_EQ(CopyToFreshFile(link.folder.Path(L"absent").c_str(), link.folder.Path(L"none").c_str()),
            static_cast<DWORD>(ERROR_FILE_NOT_FOUND));
  EXPECT_FALSE(PathExists(link.folder.Path(L"none")));
}

}  // namespace
