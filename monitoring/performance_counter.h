// One performance counter that monitoring samples: its settings and the system's query that reads it.
#pragma once

#include <json/value.h>

#include <memory>
#include <string>
#include <vector>

#include "monitoring/configuration.h"
#include "monitoring/counter_query.h"

namespace st::monitoring {

// Several work items may collect and read one counter at the same time.
class PerformanceCounter {
 public:
  // From an element of "performanceCounters". Empty, and logged, when the element is not as it has to be.
  static std::shared_ptr<PerformanceCounter> Create(const Json::Value& json, const CounterQueryMaker& makeQuery);

  // A counter that the system does not have is an object too: it is logged, and every later read of it fails.
  PerformanceCounter(CounterSettings settings, std::unique_ptr<CounterQuery> query);

  bool CollectQueryData();              // takes a sample; a failure is not logged
  bool GetCounterValue(double& value);  // what the last samples say; true: `value` is fresh. A failure is logged

  const std::wstring& Id() const { return m_settings.id; }
  const std::wstring& Query() const { return m_settings.query; }
  uint32_t SampleInterval() const { return m_settings.sampleInterval; }
  bool SavesToFile() const { return m_settings.saveToFile; }
  const std::vector<std::wstring>& TriggerIds() const { return m_settings.triggerIds; }

 private:
  bool Init();

  const CounterSettings m_settings;
  const std::unique_ptr<CounterQuery> m_query;
};

}  // namespace st::monitoring
