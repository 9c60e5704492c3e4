// The system's timers tick 64 times a second unless a process asks for more, which costs power.
#pragma once

#include <windows.h>

#include <mmsystem.h>

namespace events {

// While one lives, timers of this process are good to one millisecond.
class FineTimers {
 public:
  FineTimers() { timeBeginPeriod(kMilliseconds); }
  ~FineTimers() { timeEndPeriod(kMilliseconds); }
  FineTimers(const FineTimers&) = delete;
  FineTimers& operator=(const FineTimers&) = delete;

 private:
  static constexpr UINT kMilliseconds = 1;
};

// Shorter periods, in milliseconds, are worth it: a tick is more than a sixth of them.
constexpr int kFinePeriod = 100;

}  // namespace events
