#include "monitoring/trigger_rules.h"

namespace st::monitoring {

bool ConditionHolds(std::wstring_view condition, double sample, double threshold) {
  if (condition == L"<") return sample < threshold;
  if (condition == L">") return sample > threshold;
  if (condition == L"<=") return sample <= threshold;
  if (condition == L">=") return sample >= threshold;
  if (condition == L"=") return sample == threshold;
  return false;
}

bool CountTick(bool matched, int32_t triggerAfter, int32_t& count) {
  if (matched) ++count;
  return count >= triggerAfter;
}

}  // namespace st::monitoring
