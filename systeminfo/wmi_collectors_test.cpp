// The collectors that are one WMI table each. What they share is tested in wmi_table_test.cpp.
#include <gmock/gmock.h>

#include <thread>

#include "core/json.h"
#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/cpu_collector.h"
#include "systeminfo/network_connections_collector.h"
#include "systeminfo/printers_collector.h"
#include "systeminfo/service_collector.h"
#include "systeminfo/system_drivers_collector.h"
#include "systeminfo/wmi_wrapper.h"
#include "tests/support/fake_wmi.h"

namespace systeminfo {
namespace {

using fake_wmi::Flag;
using fake_wmi::Instance;
using fake_wmi::Nothing;
using fake_wmi::Number;
using fake_wmi::Text;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

template <class Collector>
Json::Value Collect(const std::shared_ptr<WMIWrapper>& wmi) {
  Collector collector(L"name");
  collector.Start(nullptr, wmi, nullptr);
  return collector.GetData();
}

std::string Compact(const Json::Value& value) {
  std::string text = WriteCompactJson(value);
  text.pop_back();
  return text;
}

struct TableCase {
  const wchar_t* className;
  Json::Value (*collect)(const std::shared_ptr<WMIWrapper>& wmi);
  const wchar_t* query;
  Instance instance;
  const char* expected;
  bool holeDropsTable;
};

const TableCase kCases[] = {
    {L"ServiceCollector",
     &Collect<ServiceCollector>,
     L"SELECT * FROM Win32_Service",
     {{L"DisplayName", Text(L"Sp\u00f6\u00f6ler")},
      {L"Name", Text(L"Spooler")},
      {L"State", Text(L"Running")},
      {L"StartMode", Text(L"Auto")},
      {L"ServiceType", Text(L"Own Process")},
      {L"PathName", Text(L"\"C:\\a b\\s.exe\" -k")},
      {L"StartName", Text(L"LocalSystem")}},
     R"({"DisplayName":"Sp\u00f6\u00f6ler","Name":"Spooler","PathName":"\"C:\\a b\\s.exe\" -k",)"
     R"("ServiceType":"Own Process","StartMode":"Auto","StartName":"LocalSystem","State":"Running"})",
     true},
    {L"SystemDriversCollector",
     &Collect<SystemDriversCollector>,
     L"SELECT * FROM Win32_SystemDriver",
     {{L"Name", Text(L"ACPI")},
      {L"Description", Text(L"ACPI driver")},
      {L"PathName", Text(L"C:\\acpi.sys")},
      {L"ServiceType", Text(L"Kernel Driver")},
      {L"Started", Flag(true)},
      {L"StartMode", Text(L"Boot")},
      {L"State", Text(L"Running")},
      {L"AcceptPause", Flag(false)},
      {L"AcceptStop", Flag(true)}},
     R"({"AcceptPause":0,"AcceptStop":-1,"Description":"ACPI driver","Name":"ACPI","PathName":"C:\\acpi.sys",)"
     R"("ServiceType":"Kernel Driver","StartMode":"Boot","Started":-1,"State":"Running"})",
     true},
    {L"PrintersCollector",
     &Collect<PrintersCollector>,
     L"SELECT Name, PortName, ServerName FROM Win32_Printer",
     {{L"Name", Text(L"PDF")}, {L"PortName", Text(L"PORTPROMPT:")}, {L"ServerName", Nothing()}},
     R"({"Name":"PDF","PortName":"PORTPROMPT:","ServerName":null})",
     true},
    {L"NetworkConnectionsCollector",
     &Collect<NetworkConnectionsCollector>,
     L"SELECT LocalName,RemoteName,RemotePath,ResourceType,Status,UserName FROM Win32_NetworkConnection",
     {{L"LocalName", Text(L"X:")},
      {L"RemoteName", Text(L"\\\\s\\d")},
      {L"RemotePath", Text(L"\\\\s\\d")},
      {L"ResourceType", Text(L"Disk")},
      {L"Status", Text(L"OK")},
      {L"UserName", Text(L"D\\u")}},
     R"({"LocalName":"X:","RemoteName":"\\\\s\\d","RemotePath":"\\\\s\\d","ResourceType":"Disk","Status":"OK",)"
     R"("UserName":"D\\u"})",
     false},
    {L"CpuCollector",
     &Collect<CpuCollector>,
     L"SELECT * FROM Win32_Processor",
     {{L"Architecture", Number(9)},
      {L"Caption", Text(L"x64 Family 6")},
      {L"DataWidth", Number(64)},
      {L"Description", Text(L"x64")},
      {L"Family", Number(198)},
      {L"Manufacturer", Text(L"Maker")},
      {L"MaxClockSpeed", Number(2600)},
      {L"Name", Text(L"CPU")},
      {L"ProcessorId", Text(L"178BFBFF")},
      {L"ProcessorType", Number(3)},
      {L"Revision", Nothing()}},
     R"({"Architecture":9,"Caption":"x64 Family 6","DataWidth":64,"Description":"x64","Family":198,)"
     R"("Manufacturer":"Maker","MaxClockSpeed":2600,"Name":"CPU","ProcessorId":"178BFBFF","ProcessorType":3,)"
     R"("Revision":null})",
     false},
};

TEST(WmiCollectors, EachAsksItsQueryAndWritesItsMembers) {
  for (const TableCase& row : kCases) {
    SCOPED_TRACE(ToUtf8(row.className));
    logging::ErrorCapture errors;
    FakeWmi fake;
    fake.answers[row.query].instances = {row.instance};
    EXPECT_EQ(Compact(row.collect(std::make_shared<WMIWrapper>(fake.Services()))),
              "[" + std::string(row.expected) + "]");
    EXPECT_THAT(fake.queries, ElementsAre(row.query));
    EXPECT_THAT(errors.Take(), IsEmpty());
  }
}

TEST(WmiCollectors, HoleDropsTheTableOrTheRow) {
  for (const TableCase& row : kCases) {
    SCOPED_TRACE(ToUtf8(row.className));
    logging::ErrorCapture errors;
    FakeWmi fake;
    auto& instances = fake.answers[row.query].instances;
    instances = {row.instance, row.instance, row.instance};
    instances[1].erase(instances[1].begin());
    const Json::Value data = row.collect(std::make_shared<WMIWrapper>(fake.Services()));
    EXPECT_EQ(data.isNull(), row.holeDropsTable);
    EXPECT_EQ(data.size(), row.holeDropsTable ? 0u : 2u);
    const std::vector<std::wstring> lines = errors.Take();
    ASSERT_THAT(lines, SizeIs(2));
    EXPECT_EQ(lines[1], L"systeminfo::" + std::wstring(row.className) +
                            L"::Start: propertyNames.size() != propertyValues.size()");
  }
}

TEST(WmiCollectors, FailedQueryIsAnEmptyTable) {
  for (const TableCase& row : kCases) {
    FakeWmi fake;
    fake.answers[row.query].queryStatus = WBEM_E_FAILED;
    EXPECT_EQ(Compact(row.collect(std::make_shared<WMIWrapper>(fake.Services()))), "[]") << ToUtf8(row.className);
  }
}

TEST(WmiCollectors, LiveProcessorIsTheOneOfTheRegistry) {
  std::thread([] {
    auto wmi = std::make_shared<WMIWrapper>();
    ASSERT_EQ(wmi->Init(), 0);
    const Json::Value processors = Collect<CpuCollector>(wmi);
    ASSERT_GE(processors.size(), 1u);
    wchar_t name[100] = {};
    DWORD size = sizeof name;
    ASSERT_EQ(RegGetValueW(HKEY_LOCAL_MACHINE, L"HARDWARE\\DESCRIPTION\\System\\CentralProcessor\\0",
                           L"ProcessorNameString", RRF_RT_REG_SZ, nullptr, name, &size),
              ERROR_SUCCESS);
    EXPECT_THAT(ToUtf8(name), testing::StartsWith(processors[0]["Name"].asString()));
    EXPECT_FALSE(processors[0]["Name"].asString().empty());
    EXPECT_EQ(processors[0]["DataWidth"], 64u);
  }).join();
}

}  // namespace
}  // namespace systeminfo
