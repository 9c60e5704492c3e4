// The collector "startup_programs": what starts with the system. Where to look stands in two list files that its
// settings name; the data are an array of every value of the listed registry keys, as objects of "key", "name" and
// "value", and then of every file below the listed folders, as texts.
#pragma once

#include "systeminfo/collector.h"

namespace systeminfo {

class StartupProgramsCollector : public ICollector {
 public:
  using ICollector::ICollector;

  // The data stay null when nothing was found. Uses no WMI.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;

 private:
  // `config` is what stands under the collector's key, of whatever type.
  void FromRegistry(const Json::Value& config);
  void FromFilesystemPath(const Json::Value& config, const std::atomic<bool>* cancel);
  void AppendFiles(const std::wstring& folder, const std::atomic<bool>* cancel);
};

// A value that holds a password in plain text, as the key of the automatic logon does. Its data are not collected.
// `name` is in lower case.
bool IsSecretValue(const std::wstring& name);

}  // namespace systeminfo
