#include "systeminfo/installed_software_collector.h"

#include <gmock/gmock.h>
#include <json/writer.h>

#include "tests/support/test_registry.h"

namespace systeminfo {
namespace {

constexpr wchar_t kUninstall[] = L"Software\\Microsoft\\Windows\\CurrentVersion\\Uninstall";
constexpr wchar_t kUninstall32[] = L"Software\\Wow6432Node\\Microsoft\\Windows\\CurrentVersion\\Uninstall";

Json::Value Complete() {
  Json::Value values;
  values["displayname"] = "Name";
  values["uninstallstring"] = "uninstall.exe";
  return values;
}

TEST(InstalledSoftware, EachRuleOfTheFilterDropsWhatItShould) {
  struct {
    const char* name;
    Json::Value value;  // null: the value is taken away
    bool isListed;
  } const rows[] = {
      {"displayname", Json::Value(), false},
      {"displayname", "", true},
      {"uninstallstring", Json::Value(), false},
      {"uninstallstring", "", true},
      {"parentkeyname", "Other", false},
      {"parentkeyname", "", false},
      {"systemcomponent", "0", true},
      {"systemcomponent", "1", false},
      {"systemcomponent", "", false},
      {"systemcomponent", 0, false},
      {"releasetype", "Hotfix", false},
      {"releasetype", "Service Pack", false},
      {"releasetype", "hotfix", true},
      {"releasetype", "", true},
      {"DisplayName", "names come in lower case", true},
  };
  EXPECT_TRUE(IsInstalledProgram(Complete()));
  EXPECT_FALSE(IsInstalledProgram(Json::Value(Json::objectValue)));
  for (const auto& row : rows) {
    Json::Value values = Complete();
    if (row.value.isNull()) {
      values.removeMember(row.name);
    } else {
      values[row.name] = row.value;
    }
    EXPECT_EQ(IsInstalledProgram(values), row.isListed) << row.name << " " << row.value;
  }
}

// Both machine hives and the user's in one key of the test.
class InstalledSoftwareTest : public testing::Test {
 protected:
  void AddProgram(const std::wstring& location, const std::wstring& key, const std::wstring& name) {
    m_registry.SetText(location + L"\\" + key, L"DisplayName", name);
    m_registry.SetText(location + L"\\" + key, L"UninstallString", L"uninstall.exe");
  }

  // Only meanwhile, so that the test's own key stays where it is.
  Json::Value Collect(const std::atomic<bool>* cancel = nullptr) const {
    const RedirectedHive machine(HKEY_LOCAL_MACHINE, m_registry.MakeKey(L"machine"));
    const RedirectedHive user(HKEY_CURRENT_USER, m_registry.MakeKey(L"user"));
    InstalledSoftwareCollector collector(L"installed_software");
    collector.Start(nullptr, nullptr, cancel);
    return collector.GetData();
  }

  TestRegistryKey m_registry;
};

TEST_F(InstalledSoftwareTest, ProgramsOfTheThreeListsComeInTheirOrder) {
  const std::wstring machine = std::wstring(L"machine\\") + kUninstall;
  const std::wstring machine32 = std::wstring(L"machine\\") + kUninstall32;
  const std::wstring user = std::wstring(L"user\\") + kUninstall;
  EXPECT_EQ(Collect(), Json::Value(Json::arrayValue)) << "without any list";

  AddProgram(user, L"{1}", L"Same");
  AddProgram(machine, L"{2}", L"64 bits");
  AddProgram(machine32, L"{1}", L"Same");
  m_registry.SetText(machine + L"\\{2}", L"DISPLAYVERSION", L"1.2");
  m_registry.SetText(machine + L"\\{2}", L"publisher", L"M\u00E4ker \u6771");
  m_registry.SetNumber(machine + L"\\{2}", L"InstallDate", 20260131);
  m_registry.SetNumber(machine + L"\\{2}", L"SystemComponent", 0);
  m_registry.MakeKey(machine + L"\\{3}");

  const Json::Value programs = Collect();
  ASSERT_EQ(programs.size(), 3u);
  EXPECT_EQ(programs[0]["Name"], "Same");
  EXPECT_TRUE(programs[0].isMember("Version") && programs[0]["Version"].isNull());
  Json::Value expected;
  expected["Name"] = "64 bits";
  expected["Version"] = "1.2";
  expected["Publisher"] = "M\u00E4ker \u6771";
  expected["InstallDate"] = "20260131";
  EXPECT_EQ(programs[1], expected);
  EXPECT_EQ(programs[2]["Name"], "Same");

  const std::atomic<bool> cancelled = true;
  EXPECT_EQ(Collect(&cancelled).size(), 1u) << "the first list is read in any case";
}

TEST_F(InstalledSoftwareTest, DamagedValuesCostNoOtherProgram) {
  const std::wstring location = std::wstring(L"machine\\") + kUninstall;
  AddProgram(location, L"a", L"");
  m_registry.SetValue(location + L"\\a", L"DisplayName", REG_SZ, "odd");
  m_registry.SetValue(location + L"\\a", L"DisplayVersion", REG_QWORD, "12345678");
  m_registry.SetValue(location + L"\\a", L"Publisher", REG_DWORD, "1");
  m_registry.SetValue(location + L"\\a", L"SystemComponent", REG_DWORD, "");
  AddProgram(location, L"b", std::wstring(500'000, L'n'));
  m_registry.SetValue(location + L"\\b", L"Publisher", REG_SZ, TestRegistryKey::Bytes(L"no end"));
  m_registry.SetValue(location + L"\\b", L"DisplayVersion", REG_BINARY, "");
  AddProgram(location, L"c", L"Good");

  const Json::Value programs = Collect();
  ASSERT_EQ(programs.size(), 2u) << "an empty number is not 0";
  EXPECT_EQ(programs[0]["Name"].asString().size(), 500'000u);
  EXPECT_EQ(programs[0]["Publisher"], "no end");
  EXPECT_EQ(programs[0]["Version"], "");
  EXPECT_EQ(programs[1]["Name"], "Good");
}

}  // namespace
}  // namespace systeminfo
