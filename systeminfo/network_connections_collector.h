// The second collector "network": the mapped network connections (drive letters and devices on other machines), an
// array with one object for each. Its file replaces that of NetworkCollector.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class NetworkConnectionsCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // A connection of which a property cannot be read is left out.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

}  // namespace systeminfo
