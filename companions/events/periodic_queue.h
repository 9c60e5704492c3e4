// The "GlobalEventQueue": all items of a queue in the order in which they are due, one timer for the first of them, and
// threads of the system's pool that take and run what is due. What a caller may rely on stands in
// interfaces/event_queue_api.h.
#pragma once

#include <windows.h>

#include <limits>
#include <map>
#include <memory>
#include <mutex>
#include <set>

#include "companions/events/threadpool_handles.h"
#include "companions/events/work_item.h"
#include "core/lock.h"
#include "core/logging.h"
#include "interfaces/event_queue_api.h"

namespace events {

class PeriodicQueue final : public EventQueue {
 public:
  PeriodicQueue();
  // Ends every item and waits for their callbacks. Not from inside one: ask IsInsideCallback.
  ~PeriodicQueue();
  PeriodicQueue(const PeriodicQueue&) = delete;
  PeriodicQueue& operator=(const PeriodicQueue&) = delete;

  // First, and once. ERROR_SUCCESS, or why the system makes no timer.
  DWORD Prepare();

  // What stands behind the functions of the interface.
  int32_t Add(const EventQueueItem& item, EventQueueHandle& handle);
  int32_t Remove(EventQueueHandle handle) noexcept;

  // Whether the calling thread is in a callback of an item of this queue.
  bool IsInsideCallback() const;

 private:
  using Lock = std::unique_lock<SharedLock>;
  using Items = std::map<EventQueueHandle, std::unique_ptr<WorkItem>>;

  struct Earlier {
    bool operator()(const WorkItem* a, const WorkItem* b) const {
      return a->due != b->due ? a->due < b->due : a->handle < b->handle;
    }
  };
  using DueItems = std::set<WorkItem*, Earlier>;

  // A call of Remove that waits for an item, or is in its `finished`. Lies on the stack of its thread.
  struct Waiter {
    DWORD thread;
    const WorkItem* item;
    Waiter* next;
  };

  static constexpr int64_t kNever = std::numeric_limits<int64_t>::max();

  static void CALLBACK OnTimer(PTP_CALLBACK_INSTANCE instance, void* context, PTP_TIMER timer);
  static void CALLBACK OnWork(PTP_CALLBACK_INSTANCE instance, void* context, PTP_WORK work);

  // These are called with m_lock held.
  void RunWhatIsDue(Lock& lock);
  void RunFirst(Lock& lock, int64_t now);
  void SendForNext(int64_t now);
  void WaitForRun(const WorkItem& item);
  bool WouldWaitForItself(const WorkItem& item) const;

  const std::shared_ptr<logging::CLogDLL> m_log = logging::CLogDLL::Get();
  mutable SharedLock m_lock;                             // guards all below. Not held while a callback is called
  CONDITION_VARIABLE m_ended = CONDITION_VARIABLE_INIT;  // an item that has ended is through with its callback
  EventQueueHandle m_lastHandle = 0;
  bool m_isClosing = false;
  Items m_items;
  Items m_ending;                   // those that have ended and finish themselves
  DueItems m_due;                   // those of m_items that no thread runs
  Waiter* m_waiters = nullptr;      // the latest first
  int64_t m_timerDue = kNever;      // what m_timer is set to
  bool m_isThreadUnderWay = false;  // m_work was submitted and has not begun
  ThreadpoolTimer m_timer;          // last: closing them waits for callbacks, which use all of the above
  ThreadpoolWork m_work;
};

}  // namespace events
