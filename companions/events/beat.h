// When a periodic item is due next.
#pragma once

#include <cstdint>

namespace events {

// The first beat after `now` of an item that was due at `due`. It stays on its beat, however late or long a run was;
// the beats that it missed are left out. All in one unit, counted from any one moment; `period` > 0.
constexpr int64_t NextDue(int64_t due, int64_t period, int64_t now) {
  const int64_t next = due + period;
  return next > now ? next : next + ((now - next) / period + 1) * period;
}

}  // namespace events
