// The collector "installed_software": the programs that are registered for uninstallation, without system components,
// updates and entries that belong to another one. An array of objects with "Name", "Version", "Publisher" and
// "InstallDate"; a fact that is not registered is null.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class InstalledSoftwareCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // The data are never null. Neither reads the settings nor uses WMI; `cancel` is polled between the registry's three
  // lists of programs.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

// Whether an entry of the uninstallation list is a program to report. `values` maps value names in lower case to texts.
bool IsInstalledProgram(const Json::Value& values);

// What the report says of it.
Json::Value InstalledProgram(const Json::Value& values);

}  // namespace systeminfo
