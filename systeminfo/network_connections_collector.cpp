#include "systeminfo/network_connections_collector.h"

#include "systeminfo/wmi_table.h"

namespace systeminfo {
namespace {

constexpr WmiColumn kColumns[] = {{L"LocalName"},    {L"RemoteName"}, {L"RemotePath"},
                                  {L"ResourceType"}, {L"Status"},     {L"UserName"}};

constexpr WmiTable kTable = {
    L"SELECT LocalName,RemoteName,RemotePath,ResourceType,Status,UserName FROM Win32_NetworkConnection", kColumns,
    Hole::kDropsRow, L"systeminfo::NetworkConnectionsCollector::Start"};

}  // namespace

void NetworkConnectionsCollector::Start(const std::shared_ptr<CollectingSettings>&,
                                        const std::shared_ptr<WMIWrapper>& wmi, const std::atomic<bool>*) {
  ReadWmiTable(*wmi, kTable, m_data);
}

}  // namespace systeminfo
