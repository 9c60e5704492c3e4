#include "systeminfo/installed_updates_collector.h"

#include <gmock/gmock.h>

#include "core/dynamic_library.h"
#include "core/json.h"
#include "core/logging.h"
#include "tests/support/test_registry.h"

namespace systeminfo {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

Json::Value Parse(const std::string& text) {
  Json::Value value;
  std::string error;
  EXPECT_TRUE(ParseJson(text, value, error)) << error;
  return value;
}

TEST(IsUpdate, NeedsNameUninstallStringAndTheTextOneAsSystemComponent) {
  const std::pair<const char*, bool> rows[] = {
      {R"({"displayname": "n", "uninstallstring": "u", "systemcomponent": "1"})", true},
      {R"({"displayname": "", "uninstallstring": "", "systemcomponent": "1"})", true},
      {R"({"displayname": "n", "uninstallstring": "u", "systemcomponent": "0"})", false},
      {R"({"displayname": "n", "uninstallstring": "u", "systemcomponent": "01"})", false},
      {R"({"displayname": "n", "uninstallstring": "u", "systemcomponent": 1})", false},
      {R"({"displayname": "n", "uninstallstring": "u", "systemcomponent": true})", false},
      {R"({"displayname": "n", "uninstallstring": "u", "systemcomponent": null})", false},
      {R"({"displayname": "n", "uninstallstring": "u"})", false},
      {R"({"displayname": "n", "systemcomponent": "1"})", false},
      {R"({"displayname": "n", "uninstallstring": null, "systemcomponent": "1"})", false},
      {R"({"uninstallstring": "u", "systemcomponent": "1"})", false},
      {R"({"displayname": null, "uninstallstring": "u", "systemcomponent": "1"})", false},
      {"{}", false},
  };
  for (const auto& [values, expected] : rows)
    EXPECT_EQ(IsUpdate(Parse(values)), expected) << values;
}

TEST(DescribeUpdate, MembersAreThereWhenTheirValueIs) {
  EXPECT_EQ(
      DescribeUpdate(Parse(R"({"displayname": "n", "parentdisplayname": "p", "installdate": "20240531", "x": "y"})")),
      Parse(R"({"Name": "n", "Program": "p", "InstallDate": "20240531"})"));
  EXPECT_EQ(DescribeUpdate(Parse(R"({"displayname": "n"})")), Parse(R"({"Name": "n"})"));
}

// The collector over a registry of the test's own in the place of HKEY_LOCAL_MACHINE.
class Updates : public testing::Test {
 protected:
  void AddEntry(const std::wstring& view, const std::wstring& name, bool isUpdate) {
    const std::wstring key = view + L"\\Microsoft\\Windows\\CurrentVersion\\Uninstall\\" + name;
    m_machine.SetText(key, L"DisplayName", name);
    m_machine.SetText(key, L"UninstallString", L"\"C:\\u.exe\" /x");
    if (isUpdate) m_machine.SetNumber(key, L"SystemComponent", 1);
  }

  std::string Collect(bool cancelled = false) {
    const RedirectedHive redirected(HKEY_LOCAL_MACHINE, m_machine.MakeKey({}));
    const std::atomic<bool> cancel{cancelled};
    InstalledUpdatesCollector collector(L"installed_updates");
    collector.Start(nullptr, nullptr, &cancel);
    std::string text = WriteCompactJson(collector.GetData());
    text.pop_back();
    return text;
  }

  TestRegistryKey m_machine;
  logging::ErrorCapture m_log{logging::Level::kTrace};
};

TEST_F(Updates, AreTakenFromThe32BitViewFirstAndThenFromTheOther) {
  AddEntry(L"Software", L"KB1", true);
  AddEntry(L"Software", L"KB3 \u6771", true);
  AddEntry(L"Software", L"a program", false);
  AddEntry(L"Software\\Wow6432Node", L"KB1", true);
  AddEntry(L"Software\\Wow6432Node", L"KB2", true);
  EXPECT_EQ(Collect(), R"([{"Name":"KB1"},{"Name":"KB2"},{"Name":"KB1"},{"Name":"KB3 \u6771"}])");
  EXPECT_EQ(Collect(true), R"([{"Name":"KB1"},{"Name":"KB2"}])") << "the second view is not visited any more";
  EXPECT_THAT(m_log.Take(), IsEmpty());
}

TEST_F(Updates, AbsentKeysContributeNothingWithoutAMessage) {
  EXPECT_EQ(Collect(), "[]");
  AddEntry(L"Software", L"KB1", true);
  EXPECT_EQ(Collect(), R"([{"Name":"KB1"}])");
  EXPECT_THAT(m_log.Take(), IsEmpty());
}

TEST_F(Updates, EntryThatCannotBeOpenedIsLoggedAndTheOthersStay) {
  AddEntry(L"Software", L"KB1", true);
  AddEntry(L"Software", L"KB3", true);
  const std::wstring uninstall = L"Software\\Microsoft\\Windows\\CurrentVersion\\Uninstall";
  const RegistryKeyHandle link = m_machine.MakeKey(uninstall + L"\\KB2", REG_OPTION_CREATE_LINK | REG_OPTION_VOLATILE);
  const std::string_view nowhere = TestRegistryKey::Bytes(L"\\Registry\\Machine\\Software\\st_nowhere");
  EXPECT_EQ(RegSetValueExW(link.Get(), L"SymbolicLinkValue", 0, REG_LINK, reinterpret_cast<const BYTE*>(nowhere.data()),
                           static_cast<DWORD>(nowhere.size())),
            ERROR_SUCCESS);
  EXPECT_EQ(Collect(), R"([{"Name":"KB1"},{"Name":"KB3"}])");
  EXPECT_THAT(m_log.Take(), ElementsAre(L"systeminfo::InstalledUpdatesCollector::Start: Failed to open " + uninstall +
                                        L"\\KB2, error 2"));
  const DynamicLibrary ntdll(L"ntdll.dll");
  ntdll.Resolve<LONG(WINAPI*)(HANDLE)>("NtDeleteKey")(link.Get());  // no other function deletes a link
}

TEST_F(Updates, EveryTextFormOfTheValuesCounts) {
  const std::wstring key = L"Software\\Microsoft\\Windows\\CurrentVersion\\Uninstall\\text";
  AddEntry(L"Software", L"text", false);
  m_machine.SetText(key, L"SYSTEMCOMPONENT", L"1");
  m_machine.SetText(key, L"InstallDate", L"20240531");
  m_machine.SetText(key, L"ParentDisplayName", L"Suite");
  EXPECT_EQ(Collect(), R"([{"InstallDate":"20240531","Name":"text","Program":"Suite"}])");
}

}  // namespace
}  // namespace systeminfo
