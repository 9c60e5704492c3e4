#include "systeminfo/startup_programs_collector.h"

#include <gmock/gmock.h>
#include <json/writer.h>

#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/collecting_settings.h"
#include "systeminfo/list_file.h"
#include "tests/support/test_folder.h"
#include "tests/support/test_registry.h"

namespace systeminfo {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr wchar_t kRegistryScope[] = L"systeminfo::StartupProgramsCollector::FromRegistry: ";
constexpr wchar_t kFileScope[] = L"systeminfo::StartupProgramsCollector::FromFilesystemPath: ";

TEST(ListFile, LinesAreTheEntries) {
  struct {
    const char* what;
    std::string bytes;
    std::vector<std::string> lines;
  } const rows[] = {
      {"nothing", "", {}},
      {"line ends of both kinds", "a\r\nb\nc", {"a", "b", "c"}},
      {"byte-order mark",
       "\xEF\xBB\xBF"
       "a\n",
       {"a"}},
      {"byte-order mark alone", "\xEF\xBB\xBF", {}},
      {"blank lines", "\r\n\n  \t\na\n\n", {"a"}},
      {"blanks around and within", "  a b\t\r\n", {"a b"}},
      {"not UTF-8, which becomes text later", "\xFF\n", {"\xFF"}},
  };
  for (const auto& row : rows) {
    const ListLines list = ParseListFile(row.bytes);
    EXPECT_TRUE(list.isText) << row.what;
    EXPECT_EQ(list.lines, row.lines) << row.what;
  }
  const ListLines wide =
      ParseListFile(std::string("\xFF\xFE"
                                "a\0\n\0",
                                6));
  EXPECT_FALSE(wide.isText);
  EXPECT_THAT(wide.lines, IsEmpty());
}

class StartupProgramsTest : public testing::Test {
 protected:
  // The list file with these lines, and the name of it.
  Json::Value List(const std::wstring& name, const std::wstring& text) {
    return ToUtf8(m_folder.MakeFile(name, ToUtf8(text)));
  }

  Json::Value Collect(const Json::Value& config, const std::atomic<bool>* cancel = nullptr) {
    const auto settings = std::make_shared<CollectingSettings>();
    settings->SetValue(L"startup_programs", config);
    StartupProgramsCollector collector(L"startup_programs");
    logging::ErrorCapture lines(logging::Level::kWarning);
    collector.Start(settings, nullptr, cancel);
    m_lines = lines.Take();
    return collector.GetData();
  }

  TestFolder m_folder;
  TestRegistryKey m_registry;
  std::vector<std::wstring> m_lines;
};

TEST_F(StartupProgramsTest, ValuesOfKeysComeFirstAndThenFiles) {
  m_registry.SetText(L"Run", L"Updater", L"C:\\u.exe /s");
  m_registry.SetNumber(L"Winlogon", L"AutoAdminLogon", 1);
  m_registry.SetText(L"Winlogon", L"DefaultPassword", L"secret");
  m_registry.MakeKey(L"Empty");
  m_folder.MakeFile(L"start\\a.lnk");
  m_folder.MakeFile(L"start\\deep\\er\\b.lnk");

  Json::Value config;
  config["from_registry_file"] =
      List(L"keys.txt", L"\uFEFF" + m_registry.Path(L"Run") + L"\r\nHKLM\\No\\Such\\Key\r\n\r\n" +
                            m_registry.Path(L"Empty") + L"\r\n" + m_registry.Path(L"Winlogon"));
  config["from_filesystem_path"] = List(L"folders.txt", m_folder.Path(L"start") + L"\n");
  const Json::Value data = Collect(config);

  ASSERT_EQ(data.size(), 5u) << data;
  EXPECT_EQ(data[0]["key"], ToUtf8(m_registry.Path(L"Run")));
  EXPECT_EQ(data[0]["name"], "updater");
  EXPECT_EQ(data[0]["value"], "C:\\u.exe /s");
  EXPECT_EQ(data[1]["value"], "1");
  EXPECT_EQ(data[2]["name"], "defaultpassword");
  EXPECT_EQ(data[2]["value"], "(withheld)");
  EXPECT_EQ(data[3], ToUtf8(m_folder.Path(L"start\\a.lnk")));
  EXPECT_EQ(data[4], ToUtf8(m_folder.Path(L"start\\deep\\er\\b.lnk")));
  EXPECT_THAT(m_lines, IsEmpty());

  const std::atomic<bool> cancelled = true;
  EXPECT_EQ(Collect(config, &cancelled).size(), 3u) << "the registry's half is done in any case";
}

TEST_F(StartupProgramsTest, EachMissingSettingEndsItsOwnHalf) {
  const std::wstring expected = L"Expecting a string with file name";
  for (const Json::Value& config :
       {Json::Value(true), Json::Value(), Json::Value("x"), Json::Value(Json::arrayValue)}) {
    EXPECT_TRUE(Collect(config).isNull());
    EXPECT_THAT(m_lines, ElementsAre(kRegistryScope + expected, kFileScope + expected));
  }
  m_folder.MakeFile(L"start\\a.lnk");
  Json::Value config;
  config["from_registry_file"] = 5;
  config["from_filesystem_path"] = List(L"folders.txt", m_folder.Path(L"start"));
  EXPECT_EQ(Collect(config).size(), 1u);
  EXPECT_THAT(m_lines, ElementsAre(kRegistryScope + expected));
}

TEST_F(StartupProgramsTest, UnusableEntriesCostNoOtherEntry) {
  m_folder.MakeFile(L"start\\a.lnk");
  const std::wstring file = m_folder.MakeFile(L"file");
  SetEnvironmentVariableW(L"ST_TEST_FOLDER", m_folder.Path().c_str());
  Json::Value config;
  config["from_registry_file"] = ToUtf8(m_folder.Path(L"absent.txt"));
  config["from_filesystem_path"] =
      List(L"folders.txt", L"C:\\no such folder\n\\\\.\\PhysicalDrive0\nnul\n%ST_NONE%\\x\nC:\\a|b?\n" + file +
                               L"\n%ST_TEST_FOLDER%\\start\n");
  const Json::Value data = Collect(config);
  ASSERT_EQ(data.size(), 1u) << data;
  EXPECT_EQ(data[0], ToUtf8(m_folder.Path(L"start\\a.lnk")));
  EXPECT_THAT(m_lines, ElementsAre(HasSubstr(L"absent.txt cannot be read"),
                                   kFileScope + std::wstring(L"File C:\\no such folder does not exist"),
                                   HasSubstr(L"PhysicalDrive0 is a device"), HasSubstr(L"File nul does not exist"),
                                   HasSubstr(L"does not exist"), HasSubstr(L"File C:\\a|b? does not exist"),
                                   HasSubstr(L"cannot be listed as a folder")));
}

TEST_F(StartupProgramsTest, UnusableListFilesAreLoggedAndGiveNothing) {
  Json::Value config;
  config["from_registry_file"] = ToUtf8(m_folder.MakeFile(L"wide.txt", std::string("\xFF\xFEH\0", 4)));
  config["from_filesystem_path"] = ToUtf8(m_folder.MakeFile(L"huge.txt", std::string((1 << 20) + 1, 'a')));
  EXPECT_TRUE(Collect(config).isNull());
  EXPECT_THAT(m_lines, ElementsAre(HasSubstr(L"wide.txt is not UTF-8 text"), HasSubstr(L"huge.txt cannot be read")));
}

}  // namespace
}  // namespace systeminfo
