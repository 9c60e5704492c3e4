// One periodic item of a queue: a timer of the system's thread pool that is set anew after every run, so that runs
// cannot overlap. The queue owns it and says when it ends; the item calls the subscriber.
#pragma once

#include <windows.h>

#include <atomic>
#include <optional>
#include <string>

#include "companions/events/fine_timers.h"
#include "core/lock.h"
#include "core/scoped.h"
#include "interfaces/event_queue_api.h"

namespace events {

struct ThreadpoolTimerTraits {
  using Type = PTP_TIMER;
  static bool IsValid(PTP_TIMER timer) { return timer != nullptr; }
  // Waits for a callback that is under way.
  static void Close(PTP_TIMER timer) {
    SetThreadpoolTimer(timer, nullptr, 0, 0);
    WaitForThreadpoolTimerCallbacks(timer, TRUE);
    CloseThreadpoolTimer(timer);
  }
};
using ThreadpoolTimer = Scoped<ThreadpoolTimerTraits>;

class WorkItem {
 public:
  // Who calls `finished` of an item that ends.
  enum class FinishedBy { kCaller, kOwnThread };

  // `item` has been checked.
  explicit WorkItem(const EventQueueItem& item);
  // Waits for a run that is under way: not to be called from one.
  ~WorkItem() = default;
  WorkItem(const WorkItem&) = delete;
  WorkItem& operator=(const WorkItem&) = delete;

  // Makes the timer. False when the system does not, with its error in GetLastError.
  bool Prepare();

  // The first run comes one period from now, unless the item has ended before. Once.
  void Start(EventQueueHandle handle);

  // No further run begins. With FinishedBy::kOwnThread a run must be under way; the item calls `finished` after it.
  // With FinishedBy::kCaller, Finish is to follow. Once.
  void End(FinishedBy finishedBy);

  // Waits for a run that is under way, then calls `finished`. After End.
  void Finish();

  // The thread that calls a callback of this item on behalf of the timer, or 0.
  DWORD RunningThread() const { return m_runningThread; }

  // True once an item that ended with FinishedBy::kOwnThread has called `finished`: it may be destroyed.
  bool HasFinished() const { return m_hasFinished; }

 private:
  static void CALLBACK OnTimer(PTP_CALLBACK_INSTANCE instance, void* context, PTP_TIMER timer);
  void Tick();
  bool BeginRun();
  bool EndRun();
  void SetTimer(int64_t now);
  void Call(void (*callback)(void* user, EventQueueHandle handle)) noexcept;

  const int64_t m_period;  // units of 100 ns
  const std::wstring m_subscriber;
  const EventQueueRun m_run;
  const EventQueueFinished m_finished;  // or null
  void* const m_user;
  std::optional<FineTimers> m_fineTimers;
  std::atomic<bool> m_hasThrown{false};
  EventQueueHandle m_handle = 0;
  SharedLock m_lock;
  bool m_hasEnded = false;                        // guarded by m_lock
  FinishedBy m_finishedBy = FinishedBy::kCaller;  // guarded by m_lock
  int64_t m_due = 0;                              // guarded by m_lock; units of 100 ns of the steady clock
  std::atomic<DWORD> m_runningThread{0};          // written under m_lock
  std::atomic<bool> m_hasFinished{false};         // the last that a callback writes
  ThreadpoolTimer m_timer;  // last: its destructor waits for callbacks, which use all of the above
};

}  // namespace events
