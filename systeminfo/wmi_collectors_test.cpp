// The collectors that are one WMI table each. What they share is tested in wmi_table_test.cpp.
#include <gmock/gmock.h>

#include <thread>

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

template <class Collector>
Json::Value Collect(const std::shared_ptr<WMIWrapper>& wmi) {
  Collector collector(L"name");
  collector.Start(nullptr, wmi, nullptr);
  return collector.GetData();
}

const struct {
  const wchar_t* className;
  Json::Value (*collect)(const std::shared_ptr<WMIWrapper>& wmi);
  const wchar_t* query;
  std::vector<const wchar_t*> properties;
  bool holeDropsTable;
} kCollectors[] = {
    {L"ServiceCollector",
     &Collect<ServiceCollector>,
     L"SELECT * FROM Win32_Service",
     {L"DisplayName", L"Name", L"State", L"StartMode", L"ServiceType", L"PathName", L"StartName"},
     true},
    {L"SystemDriversCollector",
     &Collect<SystemDriversCollector>,
     L"SELECT * FROM Win32_SystemDriver",
     {L"Name", L"Description", L"PathName", L"ServiceType", L"Started", L"StartMode", L"State", L"AcceptPause",
      L"AcceptStop"},
     true},
    {L"PrintersCollector",
     &Collect<PrintersCollector>,
     L"SELECT Name, PortName, ServerName FROM Win32_Printer",
     {L"Name", L"PortName", L"ServerName"},
     true},
    {L"NetworkConnectionsCollector",
     &Collect<NetworkConnectionsCollector>,
     L"SELECT LocalName,RemoteName,RemotePath,ResourceType,Status,UserName FROM Win32_NetworkConnection",
     {L"LocalName", L"RemoteName", L"RemotePath", L"ResourceType", L"Status", L"UserName"},
     false},
    {L"CpuCollector",
     &Collect<CpuCollector>,
     L"SELECT * FROM Win32_Processor",
     {L"Architecture", L"Caption", L"DataWidth", L"Description", L"Family", L"Manufacturer", L"MaxClockSpeed", L"Name",
      L"ProcessorId", L"ProcessorType", L"Revision"},
     false},
};

TEST(WmiCollectors, EachWritesItsPropertiesAndDropsWhatItMustForAHole) {
  for (const auto& row : kCollectors) {
    SCOPED_TRACE(ToUtf8(row.className));
    logging::ErrorCapture errors;
    FakeWmi fake;
    const auto collect = [&] { return row.collect(std::make_shared<WMIWrapper>(fake.Services())); };
    fake_wmi::Answer& answer = fake.answers[row.query];
    fake_wmi::Instance instance;
    Json::Value object, twice;
    for (const wchar_t* property : row.properties) {
      instance[property] = fake_wmi::Text(std::wstring(L"its ") + property);
      object[ToUtf8(property)] = "its " + ToUtf8(property);
    }
    twice.append(object);
    twice.append(object);

    answer.instances = {instance, instance};
    EXPECT_EQ(collect(), twice);
    EXPECT_THAT(fake.queries, testing::ElementsAre(row.query));
    EXPECT_THAT(errors.Take(), testing::IsEmpty());

    answer.instances.insert(answer.instances.begin() + 1, instance);
    answer.instances[1].erase(row.properties.back());
    EXPECT_EQ(collect(), row.holeDropsTable ? Json::Value() : twice);
    EXPECT_THAT(errors.Take(), testing::ElementsAre(testing::StartsWith(L"WMIWrapper::ExecuteQuery: "),
                                                    L"systeminfo::" + std::wstring(row.className) +
                                                        L"::Start: propertyNames.size() != propertyValues.size()"));

    answer.queryStatus = WBEM_E_FAILED;
    EXPECT_EQ(collect(), Json::Value(Json::arrayValue)) << "a failed query is an empty table";
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
