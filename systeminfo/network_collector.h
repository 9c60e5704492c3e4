// The collector "network": the network adapters of the machine with their IPv4 configuration, an array with one object
// for each. Its file is replaced by that of NetworkConnectionsCollector, which has the same name.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class NetworkCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // The data are never null: without a list of adapters they are empty.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

}  // namespace systeminfo
