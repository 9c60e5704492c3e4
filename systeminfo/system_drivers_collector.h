// The collector "system_drivers": the kernel and file system drivers of the machine, running or not, an array with one
// object for each.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class SystemDriversCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // A driver of which a property cannot be read leaves the data null: a table with a hole is not reported.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

}  // namespace systeminfo
