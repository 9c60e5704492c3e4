// Owners for the objects of the system's thread pool. Closing one waits for its callbacks.
#pragma once

#include <windows.h>

#include "core/scoped.h"

namespace events {

struct ThreadpoolTimerTraits {
  using Type = PTP_TIMER;
  static bool IsValid(PTP_TIMER timer) { return timer != nullptr; }
  static void Close(PTP_TIMER timer) {
    SetThreadpoolTimer(timer, nullptr, 0, 0);
    WaitForThreadpoolTimerCallbacks(timer, TRUE);
    CloseThreadpoolTimer(timer);
  }
};
using ThreadpoolTimer = Scoped<ThreadpoolTimerTraits>;

struct ThreadpoolWorkTraits {
  using Type = PTP_WORK;
  static bool IsValid(PTP_WORK work) { return work != nullptr; }
  static void Close(PTP_WORK work) {
    WaitForThreadpoolWorkCallbacks(work, TRUE);
    CloseThreadpoolWork(work);
  }
};
using ThreadpoolWork = Scoped<ThreadpoolWorkTraits>;

}  // namespace events
