#include "systeminfo/network_collector.h"

#include "systeminfo/network_adapters.h"

namespace systeminfo {

void NetworkCollector::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>&,
                             const std::atomic<bool>*) {
  const auto adapters = GetAdaptersInformation();
  m_data = DescribeAdapters(adapters.get());
}

}  // namespace systeminfo
