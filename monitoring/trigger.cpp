#include "monitoring/trigger.h"

#include <utility>

#include "monitoring/trigger_rules.h"

namespace st::monitoring {

std::shared_ptr<Trigger> Trigger::Create(const Json::Value& json) {
  std::optional<TriggerSettings> settings = ReadTrigger(json, LogNote);
  return settings ? std::make_shared<Trigger>(std::move(*settings)) : nullptr;
}

bool Trigger::Evaluate(PerformanceCounter& counter) const {
  double sample = 0;
  return counter.CollectQueryData() && counter.GetCounterValue(sample) &&
         ConditionHolds(m_settings.condition, sample, m_settings.counterValue);
}

}  // namespace st::monitoring
