// The collector "storage": the disk drives of the machine and, under the name "Partitions", its logical disks (drive
// letters).
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class DiskCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // The data are an object with the arrays "Disks" and "Partitions". One whose query failed without a row is left out;
  // without either the data stay null. A property that cannot be read is null.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

}  // namespace systeminfo
