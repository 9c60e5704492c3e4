// The collector "system_summary": one flat JSON object that shows the machine at a glance (operating system, computer,
// time zone, firmware, processor, memory, page file, main board). The queries stand apart from the object that is made
// of their rows, so that every value of it can be tested.
#pragma once

#include <windows.h>

#include <optional>

#include "systeminfo/collector.h"
#include "systeminfo/wmi_wrapper.h"

namespace systeminfo {

class SystemSummary : public ICollector {
 public:
  using ICollector::ICollector;

  // The data are never null. Neither reads the settings nor polls `cancel`.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;
};

// What the summary is made of. The rows come from the WMI class in their name; a property that is not there becomes
// null.
struct SummaryInputs {
  WMIWrapper::Row operatingSystem, computerSystem, timeZone, bios, processor, pageFileUsage, baseBoard;
  DWORD firmwareTest = 0;  // the return value of the firmware call, see system_summary.cpp
  bool hasBattery = false;
  std::optional<MEMORYSTATUSEX> memory;  // without it the five memory keys are left out
};

// Every key but those of the memory is always present.
Json::Value BuildSystemSummary(const SummaryInputs& inputs);

// The name (en-US) of a locale as WMI gives it, a hexadecimal identifier ("0409"). Null for null, and an empty string
// for an identifier that the system does not know.
Json::Value LocaleName(const Json::Value& wmiLocale);

}  // namespace systeminfo
