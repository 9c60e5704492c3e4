#include "systeminfo/product_log_folders.h"

#include <gmock/gmock.h>

#include <set>

#include "core/files.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/text.h"
#include "tests/support/test_folder.h"

namespace systeminfo {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr wchar_t kLogs[] = L"C:\\Data\\Quorvex\\Logs";
constexpr wchar_t kLogging[] = L"C:\\Data\\Quorvex\\QXLogging";
constexpr wchar_t kSettings[] = L"D:\\Product\\settings";

TEST(CandidateLogFolders, AreAbsoluteInTheirOrder) {
  struct {
    const wchar_t* dumpFolder;
    const wchar_t* expected;
  } const rows[] = {
      {L"E:\\dumps", L"E:\\dumps"},
      {L"E:/dumps/./x/../", L"E:\\dumps"},
      {L"dumps", L"D:\\Product\\dumps"},
      {L"..\\dumps", L"D:\\dumps"},
      {L"\\dumps", L"D:\\dumps"},
      {L"\\\\server\\share\\dumps", L"\\\\server\\share\\dumps"},
      {L"%NOT_SET%\\dumps", L"D:\\Product\\%NOT_SET%\\dumps"},
  };
  EXPECT_THAT(CandidateLogFolders({L"C:\\Data", L"D:\\Product", {}}), ElementsAre(kLogs, kLogging, kSettings));
  for (const auto& row : rows) {
    EXPECT_THAT(CandidateLogFolders({L"C:\\Data\\", L"D:\\Product\\", row.dumpFolder}),
                ElementsAre(kLogs, kLogging, kSettings, row.expected));
  }
}

TEST(ChooseLogFolders, KeepsTheFoldersThatHoldAllOthers) {
  using List = std::vector<std::wstring>;
  struct {
    const char* what;
    List candidates;
    List folders;
    List refused;
  } const rows[] = {
      {"all", {kLogs, kLogging, kSettings}, {kLogs, kLogging, kSettings}, {}},
      {"absent ones", {kLogs, L"C:\\absent", kSettings}, {kLogs, kSettings}, {}},
      {"one folder twice", {kLogs, kSettings, L"c:\\data\\QUORVEX\\logs"}, {kLogs, kSettings}, {}},
      {"one in an earlier one", {kLogs, L"C:\\Data\\Quorvex\\Logs\\dumps"}, {kLogs}, {}},
      {"one around earlier ones",
       {kLogs, kLogging, kSettings, L"C:\\Data\\Quorvex"},
       {kSettings, L"C:\\Data\\Quorvex"},
       {}},
      {"roots", {kLogs, L"C:\\", L"\\\\server\\share\\"}, {kLogs}, {L"C:\\", L"\\\\server\\share\\"}},
      {"around the output",
       {L"F:\\work", kLogs, L"F:\\work\\collected"},
       {kLogs},
       {L"F:\\work", L"F:\\work\\collected"}},
      {"beside the output", {L"F:\\work\\collected2"}, {L"F:\\work\\collected2"}, {}},
      {"nothing", {}, {}, {}},
  };
  for (const auto& row : rows) {
    const LogFolderChoice choice = ChooseLogFolders(row.candidates, L"F:\\work\\collected",
                                                    [](const std::wstring& folder) { return folder != L"C:\\absent"; });
    EXPECT_EQ(choice.folders, row.folders) << row.what;
    EXPECT_EQ(choice.refused, row.refused) << row.what;
  }
}

// "%programData%" means a folder of the test meanwhile.
class LogFoldersTest : public testing::Test {
 protected:
  LogFoldersTest() : m_programData(ExpandEnvironment(L"%programData%")) {
    SetEnvironmentVariableW(L"ProgramData", m_folder.MakeFolder(L"data").c_str());
    m_folder.MakeFolder(L"product\\settings");
    m_folder.MakeFolder(L"collected");
  }
  ~LogFoldersTest() override { SetEnvironmentVariableW(L"ProgramData", m_programData.c_str()); }

  std::vector<std::wstring> Write() {
    const CurrentFolder current(m_folder.Path());
    logging::ErrorCapture lines(logging::Level::kWarning);
    WriteLogFoldersConsidered(m_folder.Path(L"product"), L"collected");
    m_lines = lines.Take();
    std::string bytes;
    std::string error;
    Json::Value list;
    ReadWholeFile(m_folder.Path(L"collected\\log_folders_considered.json"), 1 << 20, bytes);
    EXPECT_TRUE(ParseJson(bytes, list, error) && list.isArray()) << bytes;
    std::vector<std::wstring> folders;
    for (const Json::Value& folder : list)
      folders.push_back(ToWide(folder.asString()));
    return folders;
  }

  static std::string Settings(const std::string& dumpPath) {
    return "<settings><qxreinit><DumpPath>" + dumpPath + "</DumpPath></qxreinit></settings>";
  }

  const std::wstring m_programData;
  TestFolder m_folder;
  std::vector<std::wstring> m_lines;
};

TEST_F(LogFoldersTest, ExistingFoldersAreListedAndTheDumpPathIsExpanded) {
  EXPECT_THAT(Write(), ElementsAre(m_folder.Path(L"product\\settings")));
  EXPECT_THAT(m_lines, Contains(HasSubstr(L"Can't get dump path from " + m_folder.Path(L"product\\qxch.xml"))));

  m_folder.MakeFolder(L"data\\Quorvex\\QXLogging");
  m_folder.MakeFolder(L"data\\D\u00FCmps \u6771");
  m_folder.MakeFile(L"product\\settings\\qxch.xml", Settings(ToUtf8(L"%ProgramData%\\D\u00FCmps \u6771")));
  EXPECT_THAT(Write(), ElementsAre(m_folder.Path(L"data\\Quorvex\\QXLogging"), m_folder.Path(L"product\\settings"),
                                   m_folder.Path(L"data\\D\u00FCmps \u6771")));
  EXPECT_THAT(m_lines, IsEmpty());

  m_folder.MakeFolder(L"product\\own");
  m_folder.MakeFile(L"product\\qxch.xml", Settings("own"));
  EXPECT_THAT(Write(), Contains(m_folder.Path(L"product\\own"))) << "the file beside the library counts first";
}

TEST_F(LogFoldersTest, UselessDumpSettingsCostOnlyTheDumpFolder) {
  const std::pair<std::string, const wchar_t*> rows[] = {
      {"no XML", L"Can't get dump path from"},
      {std::string(5 << 20, ' '), L"Can't get dump path from"},
      {Settings(""), L"Couldn't not find DumpPath in the xml"},
      {"<settings/>", L"Couldn't not find DumpPath in the xml"},
      {Settings("C:\\"), L"C:\\ holds more than the product's logs"},
      {Settings(ToUtf8(m_folder.Path())), L"holds more than the product's logs"},
  };
  for (const auto& [xml, line] : rows) {
    m_folder.MakeFile(L"product\\qxch.xml", xml);
    EXPECT_THAT(Write(), ElementsAre(m_folder.Path(L"product\\settings"))) << xml.substr(0, 80);
    EXPECT_THAT(m_lines, Contains(HasSubstr(line))) << xml.substr(0, 80);
  }
}

}  // namespace
}  // namespace systeminfo
