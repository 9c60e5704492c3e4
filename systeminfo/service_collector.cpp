#include "systeminfo/service_collector.h"

#include "systeminfo/wmi_table.h"

namespace systeminfo {
namespace {

constexpr WmiColumn kColumns[] = {{L"DisplayName"}, {L"Name"},     {L"State"},    {L"StartMode"},
                                  {L"ServiceType"}, {L"PathName"}, {L"StartName"}};

constexpr WmiTable kTable = {L"SELECT * FROM Win32_Service", kColumns, Hole::kDropsTable,
                             L"systeminfo::ServiceCollector::Start"};

}  // namespace

void ServiceCollector::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>& wmi,
                             const std::atomic<bool>*) {
  ReadWmiTable(*wmi, kTable, m_data);
}

}  // namespace systeminfo
