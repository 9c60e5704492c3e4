// The collector "services": the services of the machine, an array with one object for each.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class ServiceCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // A service of which a property cannot be read leaves the data null: a table with a hole is not reported.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

}  // namespace systeminfo
