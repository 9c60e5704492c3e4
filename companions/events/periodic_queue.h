// The "GlobalEventQueue": which items there are, and who may wait for whom. What a caller may rely on stands in
// interfaces/event_queue_api.h.
#pragma once

#include <windows.h>

#include <map>
#include <memory>

#include "companions/events/work_item.h"
#include "core/lock.h"
#include "core/logging.h"
#include "interfaces/event_queue_api.h"

namespace events {

class PeriodicQueue final : public EventQueue {
 public:
  PeriodicQueue();
  // Ends every item and waits for their callbacks. Not inside one: ask IsInsideCallback.
  ~PeriodicQueue();
  PeriodicQueue(const PeriodicQueue&) = delete;
  PeriodicQueue& operator=(const PeriodicQueue&) = delete;

  int32_t Add(const EventQueueItem& item, EventQueueHandle& handle);
  int32_t Remove(EventQueueHandle handle) noexcept;

  // Whether the calling thread is in a callback of an item of this queue.
  bool IsInsideCallback() const;

 private:
  using Items = std::map<EventQueueHandle, std::unique_ptr<WorkItem>>;

  // A call of Remove that waits for an item, or is in its `finished`. Lies on the stack of its thread.
  struct Waiter {
    DWORD thread;
    const WorkItem* item;
    Waiter* next;
  };

  bool WouldWaitForItself(const WorkItem& item) const;
  void RemoveWaiter(const Waiter& waiter);
  Items TakeFinished();

  const std::shared_ptr<logging::CLogDLL> m_log = logging::CLogDLL::Get();
  mutable SharedLock m_lock;  // guards all below; an item's own lock is taken inside it, never the other way round
  EventQueueHandle m_lastHandle = 0;
  bool m_isClosing = false;
  Items m_items;
  Items m_ending;               // whose own threads call `finished`; kept until they have done so
  Waiter* m_waiters = nullptr;  // the latest first
};

}  // namespace events
