#include "systeminfo/collector_table.h"

#include "systeminfo/cpu_collector.h"
#include "systeminfo/disk_collector.h"
#include "systeminfo/installed_updates_collector.h"
#include "systeminfo/network_collector.h"
#include "systeminfo/network_connections_collector.h"
#include "systeminfo/printers_collector.h"
#include "systeminfo/service_collector.h"
#include "systeminfo/system_drivers_collector.h"
#include "systeminfo/system_summary.h"

namespace systeminfo {
namespace {

template <class Collector>
std::shared_ptr<ICollector> Make(std::wstring name) {
  return std::make_shared<Collector>(std::move(name));
}

// The only list. A collector that writes the same file as an earlier one replaces it.
constexpr CollectorRow kCollectors[] = {
    {L"system_summary", L"SystemSummary", &Make<SystemSummary>},
    {L"processor", L"CpuCollector", &Make<CpuCollector>},
    {L"storage", L"DiskCollector", &Make<DiskCollector>},
    {L"network", L"NetworkCollector", &Make<NetworkCollector>},
    {L"printers", L"PrintersCollector", &Make<PrintersCollector>},
    {L"system_drivers", L"SystemDriversCollector", &Make<SystemDriversCollector>},
    {L"network", L"NetworkConnectionsCollector", &Make<NetworkConnectionsCollector>},
    {L"services", L"ServiceCollector", &Make<ServiceCollector>},
    {L"installed_updates", L"InstalledUpdatesCollector", &Make<InstalledUpdatesCollector>},
};

}  // namespace

std::span<const CollectorRow> CollectorTable() {
  return kCollectors;
}

}  // namespace systeminfo
