// The collector "installed_updates": the updates of the operating system and of programs that the uninstall registry
// records, an array with one object for each, the 32-bit view's first.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class InstalledUpdatesCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // The data are never null. An update that both views hold is listed twice. `cancel` is looked at between the views.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

// The rules over the values of one key of the uninstall registry: an object of value name, in lower case, to text.
bool IsUpdate(const Json::Value& values);
Json::Value DescribeUpdate(const Json::Value& values);

}  // namespace systeminfo
