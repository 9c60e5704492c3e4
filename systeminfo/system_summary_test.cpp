#include "systeminfo/system_summary.h"

#include <gmock/gmock.h>

#include <thread>

#include "tests/support/fake_wmi.h"

namespace systeminfo {
namespace {

using fake_wmi::Number;
using fake_wmi::Text;
using testing::ElementsAre;

// Every key whose value comes from WMI, and what it is when each property holds "Class.Property".
const struct {
  const char* key;
  Json::Value expected;
} kWmiKeys[] = {
    {"OS Name", "OperatingSystem.Caption"},
    {"OS Version", "OperatingSystem.Version"},
    {"OS CSD Version", "OperatingSystem.CSDVersion"},
    {"OS Build Number", "OperatingSystem.BuildNumber"},
    {"OS Manufacturer", "OperatingSystem.Manufacturer"},
    {"OS installation date", "OperatingSystem.InstallDate"},
    {"System Name", "ComputerSystem.Name"},
    {"System Manufacturer", "ComputerSystem.Manufacturer"},
    {"System Model", "ComputerSystem.Model"},
    {"System Type", "ComputerSystem.SystemType"},
    {"Windows Directory", "OperatingSystem.WindowsDirectory"},
    {"System Directory", "OperatingSystem.SystemDirectory"},
    {"Boot Device", "OperatingSystem.BootDevice"},
    {"Locale", "en-US"},
    {"User Name", "ComputerSystem.UserName"},
    {"Time Zone", "TimeZone.Caption"},
    {"BIOS Manufacturer", "BIOS.Manufacturer"},
    {"BIOS Version", "BIOS.SMBIOSBIOSVersion"},
    {"BIOS Release Date", "BIOS.ReleaseDate"},
    {"CPU Name", "Processor.Name"},
    {"CPU cores", 4u},
    {"CPU logical processors", 8u},
    {"Page File", "PageFileUsage.Name"},
    {"BaseBoard Manufacturer", "BaseBoard.Manufacturer"},
    {"BaseBoard Model", "BaseBoard.Model"},
    {"BaseBoard Name", "BaseBoard.Name"},
};
constexpr const char* kMemoryKeys[] = {"Installed Physical Memory", "Available Physical Memory", "Total Virtual Memory",
                                       "Available Virtual Memory", "Page File Space"};

Json::Value Collect(const std::shared_ptr<WMIWrapper>& wmi) {
  SystemSummary collector(L"system_summary");
  collector.Start(nullptr, wmi, nullptr);
  return collector.GetData();
}

TEST(SystemSummary, SilentWmiLeavesEveryWmiKeyNullAndEveryKeyPresent) {
  FakeWmi fake;
  const Json::Value summary = Collect(std::make_shared<WMIWrapper>(fake.Services()));
  EXPECT_EQ(summary.size(), std::size(kWmiKeys) + std::size(kMemoryKeys) + 2);
  EXPECT_TRUE(summary["BIOS Mode"].isString());
  for (const auto& row : kWmiKeys)
    EXPECT_TRUE(summary.isMember(row.key) && summary[row.key].isNull()) << row.key;
  for (const char* key : kMemoryKeys)
    EXPECT_EQ(summary[key].type(), Json::realValue) << key;
  EXPECT_EQ(summary["Platform Role"], "Desktop");
  EXPECT_THAT(fake.queries, ElementsAre(L"SELECT * FROM Win32_OperatingSystem", L"SELECT * FROM Win32_ComputerSystem",
                                        L"SELECT * FROM Win32_TimeZone", L"SELECT * FROM Win32_BIOS",
                                        L"SELECT * FROM Win32_Processor", L"SELECT * FROM Win32_PageFileUsage",
                                        L"SELECT * FROM Win32_BaseBoard", L"SELECT * FROM Win32_Battery"));
}

TEST(SystemSummary, ValuesComeFromTheirClassAndProperty) {
  FakeWmi fake;
  const std::pair<const wchar_t*, std::vector<const wchar_t*>> classes[] = {
      {L"OperatingSystem",
       {L"Caption", L"Version", L"InstallDate", L"CSDVersion", L"BuildNumber", L"Manufacturer", L"WindowsDirectory",
        L"SystemDirectory", L"CurrentTimeZone", L"BootDevice"}},
      {L"ComputerSystem", {L"Name", L"Manufacturer", L"Model", L"SystemType", L"UserName"}},
      {L"TimeZone", {L"Caption"}},
      {L"BIOS", {L"Manufacturer", L"SMBIOSBIOSVersion", L"ReleaseDate"}},
      {L"Processor", {L"Name"}},
      {L"PageFileUsage", {L"Name"}},
      {L"BaseBoard", {L"Manufacturer", L"Model", L"Name"}},
  };
  for (const auto& [name, properties] : classes) {
    fake_wmi::Instance first;
    for (const wchar_t* property : properties)
      first[property] = Text(std::wstring(name) + L"." + property);
    fake.answers[std::wstring(L"SELECT * FROM Win32_") + name].instances = {first, {{L"Name", Text(L"second")}}};
  }
  fake.answers[L"SELECT * FROM Win32_OperatingSystem"].instances[0][L"Locale"] = Text(L"0409");
  fake.answers[L"SELECT * FROM Win32_Processor"].instances[0][L"NumberOfCores"] = Number(4);
  fake.answers[L"SELECT * FROM Win32_Processor"].instances[0][L"NumberOfLogicalProcessors"] = Number(8);
  fake.answers[L"SELECT * FROM Win32_Battery"].instances = {{{L"Name", Text(L"BAT0")}}};

  const Json::Value summary = Collect(std::make_shared<WMIWrapper>(fake.Services()));
  for (const auto& row : kWmiKeys)
    EXPECT_EQ(summary[row.key], row.expected) << row.key;
  EXPECT_EQ(summary["Platform Role"], "Laptop");
}

TEST(SystemSummary, MemoryCountsAreUnsignedAndLeftOutWhenUnknown) {
  SummaryInputs inputs;
  EXPECT_FALSE(BuildSystemSummary(inputs).isMember("Installed Physical Memory"));
  EXPECT_EQ(BuildSystemSummary(inputs).size(), std::size(kWmiKeys) + 2);

  inputs.memory = MEMORYSTATUSEX{};
  inputs.memory->ullTotalPhys = 0xFFFF'0000'0000'0000;
  inputs.memory->ullAvailPhys = 1;
  inputs.memory->ullTotalVirtual = 2;
  inputs.memory->ullAvailVirtual = 3;
  inputs.memory->ullTotalPageFile = 4;
  const Json::Value summary = BuildSystemSummary(inputs);
  EXPECT_EQ(summary["Installed Physical Memory"], Json::Value(18446462598732840960.0));
  EXPECT_EQ(summary["Available Physical Memory"], Json::Value(1.0));
  EXPECT_EQ(summary["Total Virtual Memory"], Json::Value(2.0));
  EXPECT_EQ(summary["Available Virtual Memory"], Json::Value(3.0));
  EXPECT_EQ(summary["Page File Space"], Json::Value(4.0));
}

TEST(SystemSummary, BiosModeIsLegacyOnlyForTheReturnValueOne) {
  for (const DWORD result : {0u, 1u, 2u}) {
    SummaryInputs inputs;
    inputs.firmwareTest = result;
    EXPECT_EQ(BuildSystemSummary(inputs)["BIOS Mode"], result == 1 ? "Legacy" : "UEFI") << result;
  }
}

TEST(SystemSummary, OneBatteryMakesALaptopAlsoWhenTheListBreaksOff) {
  FakeWmi fake;
  fake_wmi::Answer& batteries = fake.answers[L"SELECT * FROM Win32_Battery"];
  const auto role = [&fake] { return Collect(std::make_shared<WMIWrapper>(fake.Services()))["Platform Role"]; };
  batteries.queryStatus = WBEM_E_FAILED;
  EXPECT_EQ(role(), "Desktop");
  batteries.queryStatus = WBEM_S_NO_ERROR;
  batteries.endStatus = WBEM_E_FAILED;
  EXPECT_EQ(role(), "Desktop");
  batteries.instances = {{{L"Name", fake_wmi::Failure(WBEM_E_FAILED)}}, {}};
  EXPECT_EQ(role(), "Laptop") << "a battery without a name is one";
}

TEST(LocaleName, KnownUnknownAndUnreadableIdentifiers) {
  EXPECT_EQ(LocaleName("0409"), "en-US");
  EXPECT_EQ(LocaleName("0407"), "de-DE");
  EXPECT_EQ(LocaleName("409"), "en-US");
  for (const char* text : {"9999", "", "xyz", "FFFFFFFFFFFF", "-1"})
    EXPECT_EQ(LocaleName(text), "") << text;
  EXPECT_TRUE(LocaleName(Json::Value()).isNull());
  EXPECT_TRUE(LocaleName(Json::Value(1033)).isNull());
}

TEST(SystemSummary, LiveSummaryNamesThisMachine) {
  std::thread([] {
    auto wmi = std::make_shared<WMIWrapper>();
    ASSERT_EQ(wmi->Init(), 0);
    const Json::Value summary = Collect(wmi);
    EXPECT_TRUE(summary["OS Name"].isString());
    EXPECT_THAT(summary["OS installation date"].asString(), testing::MatchesRegex("\\d+\\.\\d+.\\d+"));
    EXPECT_FALSE(summary["System Name"].asString().empty());
    EXPECT_FALSE(summary["Locale"].asString().empty());
    EXPECT_EQ(summary["CPU cores"].type(), Json::uintValue);
    EXPECT_GT(summary["Installed Physical Memory"].asDouble(), double{1 << 20});
  }).join();
}

}  // namespace
}  // namespace systeminfo
