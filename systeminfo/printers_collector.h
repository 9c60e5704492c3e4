// The collector "printers": the printers that the user of the process sees, an array with one object for each.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class PrintersCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // A printer of which a property cannot be read leaves the data null: a table with a hole is not reported.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

}  // namespace systeminfo
