// The collector "processor": the processors of the machine (one for each socket), an array with one object for each.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class CpuCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // A processor of which a property cannot be read is left out.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

}  // namespace systeminfo
