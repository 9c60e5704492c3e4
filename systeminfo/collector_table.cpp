#include "systeminfo/collector_table.h"

#include "systeminfo/event_log_collector.h"
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
    {L"windows_events", L"EventLogCollector", &Make<EventLogCollector>},
};

}  // namespace

std::span<const CollectorRow> CollectorTable() {
  return kCollectors;
}

}  // namespace systeminfo
