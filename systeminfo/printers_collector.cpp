#include "systeminfo/printers_collector.h"

#include "systeminfo/wmi_table.h"

namespace systeminfo {
namespace {

constexpr WmiColumn kColumns[] = {{L"Name"}, {L"PortName"}, {L"ServerName"}};

constexpr WmiTable kTable = {L"SELECT Name, PortName, ServerName FROM Win32_Printer", kColumns, Hole::kDropsTable,
                             L"systeminfo::PrintersCollector::Start"};

}  // namespace

void PrintersCollector::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>& wmi,
                              const std::atomic<bool>*) {
  ReadWmiTable(*wmi, kTable, m_data);
}

}  // namespace systeminfo
