// When a trigger fires: pure rules over numbers.
#pragma once

#include <cstdint>
#include <string_view>

namespace st::monitoring {

// Knows "<", ">", "<=", ">=" and "="; any other text, the empty one too, never holds. That the configuration accepts
// the empty text and refuses "=" is so on purpose.
bool ConditionHolds(std::wstring_view condition, double sample, double threshold);

// Counts one tick of a pair; true when the trigger fires. Matches are counted in total, not in a row, and a
// `triggerAfter` of 0 or less fires on any tick, matched or not. Not called again once it fired.
bool CountTick(bool matched, int32_t triggerAfter, int32_t& count);

}  // namespace st::monitoring
