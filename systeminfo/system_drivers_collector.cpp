#include "systeminfo/system_drivers_collector.h"

#include "systeminfo/wmi_table.h"

namespace systeminfo {
namespace {

constexpr WmiColumn kColumns[] = {{L"Name"},      {L"Description"}, {L"PathName"},    {L"ServiceType"}, {L"Started"},
                                  {L"StartMode"}, {L"State"},       {L"AcceptPause"}, {L"AcceptStop"}};

constexpr WmiTable kTable = {L"SELECT * FROM Win32_SystemDriver", kColumns, Hole::kDropsTable,
                             L"systeminfo::SystemDriversCollector::Start"};

}  // namespace

void SystemDriversCollector::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>& wmi,
                                   const std::atomic<bool>*) {
  ReadWmiTable(*wmi, kTable, m_data);
}

}  // namespace systeminfo
