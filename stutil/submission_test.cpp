#include "stutil/submission.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <stdexcept>
#include <vector>

#include "core/files.h"
#include "core/logging.h"
#include "core/program_path.h"
#include "core/text.h"
#include "stutil/skylane_api.h"
#include "tests/support/test_folder.h"

namespace {

using stutil::TessaroSubmitFile;
using testing::ElementsAre;

std::string FakeLibrary() {
  std::string bytes;
  if (ReadWholeFile(ProgramFolder() + L"\\fake_qxlink\\qxlink.dll", 64 << 20, bytes) != ERROR_SUCCESS) {
    throw std::runtime_error("the fake library is not built");
  }
  return bytes;
}

// The library with that export under another name. The name keeps its place in the sorted table of names, so that the
// others are still found.
std::string WithoutExport(std::string library, const std::string& name) {
  const size_t at = library.find('\0' + name + '\0');  // the table comes before the symbols for the debugger
  if (at == std::string::npos) throw std::runtime_error("no export " + name);
  --library[at + name.size()];
  return library;
}

// While one lives, libraries are found by their bare name in this folder only, and not in the program's.
class LibrarySearch {
 public:
  explicit LibrarySearch(const std::wstring& folder) {
    SetDefaultDllDirectories(LOAD_LIBRARY_SEARCH_USER_DIRS);
    m_cookie = AddDllDirectory(folder.c_str());
  }
  ~LibrarySearch() {
    RemoveDllDirectory(m_cookie);
    SetDefaultDllDirectories(LOAD_LIBRARY_SEARCH_DEFAULT_DIRS);
  }
  LibrarySearch(const LibrarySearch&) = delete;
  LibrarySearch& operator=(const LibrarySearch&) = delete;

 private:
  DLL_DIRECTORY_COOKIE m_cookie;
};

class SubmissionTest : public testing::Test {
 protected:
  // What the fake library answers; see tests/children/fake_qxlink.cpp.
  void Script(const wchar_t* init, const wchar_t* uploads, const wchar_t* option) {
    m_folder.MakeFile(L"library\\qxlink.dll", FakeLibrary());
    SetEnvironmentVariableW(L"FAKE_QXLINK_INIT", init);
    SetEnvironmentVariableW(L"FAKE_QXLINK_UPLOADS", uploads);
    SetEnvironmentVariableW(L"FAKE_QXLINK_OPTION", option);
    SetEnvironmentVariableW(L"FAKE_QXLINK_RECORD", m_folder.Path(L"record").c_str());
  }

  std::string Record() const {
    std::string record;
    ReadWholeFile(m_folder.Path(L"record"), 1 << 20, record);
    return record;
  }

  static bool IsLoaded() { return GetModuleHandleW(L"qxlink.dll") != nullptr; }

  const TestFolder m_folder;
  const LibrarySearch m_search{m_folder.MakeFolder(L"library")};
};

constexpr wchar_t kPackage[] = L"C:\\data \u00e4\\collected.zip";
const std::string kUploadCall =
    "upload C:\\data \xC3\xA4\\collected.zip kvsetuplogs {\"tags\":[\"Quorvex Guard Basic\",\"support_tool\"]}\n\n";

TEST_F(SubmissionTest, FollowsTheResultsOfTheLibrary) {
  const std::string setPlainHttp = "set_option 20 1\n";
  const auto failed = [](const wchar_t* result) {
    return L"TessaroSubmitFile: qxskylane error uploading file '" + std::wstring(kPackage) + L"' " + result;
  };
  struct {
    const wchar_t* init;
    const wchar_t* uploads;
    const wchar_t* option;
    bool isSubmitted;
    std::string calls;
    std::vector<std::wstring> lines;
  } const rows[] = {
      {L"0", L"0", L"0", true, "init\n" + kUploadCall + "uninit\n", {}},
      {L"5", L"0", L"0", false, "init\n", {L"TessaroSubmitFile: qxskylane error on context init 5"}},
      {L"0", L"1001", L"0", false, "init\n" + kUploadCall + "uninit\n", {failed(L"1001")}},
      {L"0", L"-7,0", L"0", false, "init\n" + kUploadCall + "uninit\n", {failed(L"-7")}},
      {L"0",
       L"1002,0",
       L"0",
       true,
       "init\n" + kUploadCall + setPlainHttp + kUploadCall + "uninit\n",
       {L"TessaroSubmitFile: Error [1002], falling back to plain http, setopt ret [0]"}},
      {L"0",
       L"1002,1002,0",
       L"6",
       false,
       "init\n" + kUploadCall + setPlainHttp + kUploadCall + "uninit\n",
       {L"TessaroSubmitFile: Error [1002], falling back to plain http, setopt ret [6]", failed(L"1002")}},
      {L"0",
       L"1002,3",
       L"0",
       false,
       "init\n" + kUploadCall + setPlainHttp + kUploadCall + "uninit\n",
       {L"TessaroSubmitFile: Error [1002], falling back to plain http, setopt ret [0]", failed(L"3")}},
  };
  for (const auto& row : rows) {
    Script(row.init, row.uploads, row.option);
    DeleteFileW(m_folder.Path(L"record").c_str());
    logging::ErrorCapture capture(logging::Level::kTrace);
    EXPECT_EQ(TessaroSubmitFile(0, kPackage), row.isSubmitted);
    EXPECT_EQ(Record(), row.calls);
    EXPECT_EQ(capture.Take(), row.lines);
    EXPECT_FALSE(IsLoaded());
  }
}

TEST_F(SubmissionTest, WithoutTheLibraryItFails) {
  logging::ErrorCapture capture;
  EXPECT_FALSE(TessaroSubmitFile(0, kPackage));
  EXPECT_THAT(capture.Take(), ElementsAre(L"TessaroSubmitFile: error loading skylane library"));
}

TEST_F(SubmissionTest, ALibraryThatLacksAnyExportIsTreatedAsMissing) {
  const char* const names[] = {
      "init",       "uninit",           "push_info",   "push_json",      "push_bin",      "ask",
      "ask_json",   "ask_bin",          "ask_async",   "ask_json_async", "ask_bin_async", "free_response",
      "text",       "set_option",       "set_optionv", "get_option",     "file_upload",   "file_upload_async",
      "mem_upload", "mem_upload_async",
  };
  ASSERT_EQ(std::size(names), 20u);
  Script(L"0", L"0", L"0");
  EXPECT_NE(stutil::LoadSkylaneApi(), nullptr);
  const auto isMissing = [](const std::string& name) {
    const DynamicLibrary library(L"qxlink.dll");
    return library.Resolve<FARPROC>(("qxskylane_" + name).c_str()) == nullptr;
  };
  for (const std::string name : names) {
    m_folder.MakeFile(L"library\\qxlink.dll", WithoutExport(FakeLibrary(), "qxskylane_" + name));
    ASSERT_EQ(std::count_if(std::begin(names), std::end(names), isMissing), 1) << name;

    logging::ErrorCapture capture;
    EXPECT_FALSE(TessaroSubmitFile(0, kPackage)) << name;
    EXPECT_THAT(capture.Take(), ElementsAre(L"TessaroSubmitFile: error loading skylane library")) << name;
    EXPECT_FALSE(IsLoaded()) << name;
  }
  EXPECT_EQ(Record(), "");
}

}  // namespace
