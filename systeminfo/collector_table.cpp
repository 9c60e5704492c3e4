#include "systeminfo/collector_table.h"

#include "systeminfo/cpu_collector.h"
#include "systeminfo/disk_collector.h"
#include "systeminfo/event_log_collector.h"
#include "systeminfo/installed_software_collector.h"
#include "systeminfo/installed_updates_collector.h"
#include "systeminfo/network_collector.h"
#include "systeminfo/network_connections_collector.h"
#include "systeminfo/printers_collector.h"
#include "systeminfo/process_collector.h"
#include "systeminfo/process_dump_collector.h"
#include "systeminfo/product_information_collector.h"
#include "systeminfo/registry_collector.h"
#include "systeminfo/service_collector.h"
#include "systeminfo/startup_programs_collector.h"
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
    {L"running_tasks", L"ProcessCollector", &Make<ProcessCollector>},
    {L"startup_programs", L"StartupProgramsCollector", &Make<StartupProgramsCollector>},
    {L"installed_software", L"InstalledSoftwareCollector", &Make<InstalledSoftwareCollector>},
    {L"installed_updates", L"InstalledUpdatesCollector", &Make<InstalledUpdatesCollector>},
    {L"windows_events", L"EventLogCollector", &Make<EventLogCollector>},
    {L"process_dumps", L"ProcessDumpCollector", &Make<ProcessDumpCollector>},
    {L"product_information", L"ProductInformationCollector", &Make<ProductInformationCollector>},
    {L"registry", L"RegistryCollector", &Make<RegistryCollector>},
};

}  // namespace

std::span<const CollectorRow> CollectorTable() {
  return kCollectors;
}

}  // namespace systeminfo
