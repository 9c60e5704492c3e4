#include "systeminfo/cpu_collector.h"

#include "systeminfo/wmi_table.h"

namespace systeminfo {
namespace {

constexpr WmiColumn kColumns[] = {{L"Architecture"}, {L"Caption"},       {L"DataWidth"},     {L"Description"},
                                  {L"Family"},       {L"Manufacturer"},  {L"MaxClockSpeed"}, {L"Name"},
                                  {L"ProcessorId"},  {L"ProcessorType"}, {L"Revision"}};

constexpr WmiTable kTable = {L"SELECT * FROM Win32_Processor", kColumns, Hole::kDropsRow,
                             L"systeminfo::CpuCollector::Start"};

}  // namespace

void CpuCollector::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>& wmi,
                         const std::atomic<bool>*) {
  ReadWmiTable(*wmi, kTable, m_data);
}

}  // namespace systeminfo
