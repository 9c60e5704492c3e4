// A comparison of a counter's reading with a fixed threshold, and the actions that follow when it held often enough.
// How often it held is counted by the manager, for each counter that lists the trigger on its own.
#pragma once

#include <json/value.h>

#include <memory>
#include <string>
#include <vector>

#include "monitoring/configuration.h"
#include "monitoring/performance_counter.h"

namespace st::monitoring {

class Trigger {
 public:
  // From an element of "triggers". Empty, and logged, when the element is not as it has to be.
  static std::shared_ptr<Trigger> Create(const Json::Value& json);

  explicit Trigger(TriggerSettings settings) : m_settings(std::move(settings)) {}

  // Takes a sample of its own; true when it could be read and satisfies the condition.
  bool Evaluate(PerformanceCounter& counter) const;

  const std::wstring& Id() const { return m_settings.id; }
  int32_t TriggerAfter() const { return m_settings.triggerAfter; }
  const std::vector<std::wstring>& ActionIds() const { return m_settings.actionIds; }

 private:
  const TriggerSettings m_settings;
};

}  // namespace st::monitoring
