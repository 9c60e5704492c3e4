// One periodic item of a queue, as plain data; the queue owns it and knows all rules.
#pragma once

#include <windows.h>

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>

#include "companions/events/fine_timers.h"
#include "interfaces/event_queue_api.h"

namespace events {

// Times are counted in the units that the system's timers are set in.
using Ticks = std::chrono::duration<int64_t, std::ratio<1, 10'000'000>>;

// What is said of members holds under the queue's lock.
struct WorkItem {
  // `item` has been checked.
  WorkItem(const EventQueueItem& item, EventQueueHandle itsHandle)
      : handle(itsHandle),
        period(Ticks(std::chrono::milliseconds(item.period_ms)).count()),
        subscriber(item.subscriber),
        run(item.run),
        finished(item.finished),
        user(item.user) {
    if (item.period_ms < kFinePeriod) fineTimers.emplace();
  }

  const EventQueueHandle handle;
  const int64_t period;  // ticks
  const std::wstring subscriber;
  const EventQueueRun run;
  const EventQueueFinished finished;  // or null
  void* const user;
  std::optional<FineTimers> fineTimers;

  int64_t due = 0;              // of the next run, or of the one under way
  DWORD runningThread = 0;      // which is in a callback on behalf of the timer
  bool hasEnded = false;        // no further run begins
  bool finishesItself = false;  // it ended, and the thread that runs it calls `finished`
  bool hasThrown = false;       // written by the thread that is in a callback
};

}  // namespace events
