// The collector "registry": the values and subkeys, all the way down, of every registry key that the settings list
// under its name. The data are an object of listed path to dump, see utils::DumpKey.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class RegistryCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // Takes the paths from the settings' array (or object, whose member names do not count) under the collector's name.
  // The data stay null when not one of the keys could be opened.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

}  // namespace systeminfo
