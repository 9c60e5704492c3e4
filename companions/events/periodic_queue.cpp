#include "companions/events/periodic_queue.h"

#include <algorithm>
#include <mutex>
#include <new>
#include <utility>

namespace events {
namespace {

constexpr wchar_t kScheduleScope[] = L"GlobalEventQueue::SchedulePeriodic";

bool IsValid(const EventQueueItem* item) {
  return item != nullptr && item->size >= sizeof(EventQueueItem) && item->period_ms > 0 &&
         item->subscriber != nullptr && item->run != nullptr;
}

int32_t OnSchedulePeriodic(EventQueue* queue, const EventQueueItem* item, EventQueueHandle* handle) {
  if (handle == nullptr) return EVENT_QUEUE_BAD_ARGUMENT;
  *handle = 0;
  if (queue == nullptr || !IsValid(item)) return EVENT_QUEUE_BAD_ARGUMENT;
  try {
    return static_cast<PeriodicQueue*>(queue)->Add(*item, *handle);
  } catch (...) {  // only memory can fail
    return EVENT_QUEUE_OUT_OF_MEMORY;
  }
}

int32_t OnCancel(EventQueue* queue, EventQueueHandle handle) {
  return queue == nullptr ? static_cast<int32_t>(EVENT_QUEUE_BAD_ARGUMENT)
                          : static_cast<PeriodicQueue*>(queue)->Remove(handle);
}

}  // namespace

PeriodicQueue::PeriodicQueue() : EventQueue{&OnSchedulePeriodic, &OnCancel} {}

PeriodicQueue::~PeriodicQueue() {
  Items items;
  {
    const std::lock_guard lock(m_lock);
    m_isClosing = true;
    items.swap(m_items);
    for (const auto& [handle, item] : items)
      item->End(WorkItem::FinishedBy::kCaller);
  }
  for (const auto& [handle, item] : items)
    item->Finish();
  m_ending.clear();  // nothing adds to it any more; waits
}

int32_t PeriodicQueue::Add(const EventQueueItem& item, EventQueueHandle& handle) {
  auto made = std::make_unique<WorkItem>(item);
  if (!made->Prepare()) {
    const DWORD error = GetLastError();
    LOG_ERROR(kScheduleScope, L"no timer for an item of '%s', error %u", item.subscriber, error);
    SetLastError(error);
    return EVENT_QUEUE_SYSTEM_ERROR;
  }
  Items finished;  // before the lock: destroyed without it
  const std::lock_guard lock(m_lock);
  if (m_isClosing) return EVENT_QUEUE_CLOSING;
  finished = TakeFinished();
  WorkItem& added = *m_items.emplace(m_lastHandle + 1, std::move(made)).first->second;
  handle = ++m_lastHandle;
  added.Start(handle);
  return EVENT_QUEUE_OK;
}

int32_t PeriodicQueue::Remove(EventQueueHandle handle) noexcept {
  Items::node_type node;
  Waiter waiter{GetCurrentThreadId(), nullptr, nullptr};
  {
    const std::lock_guard lock(m_lock);
    node = m_items.extract(handle);
    if (node.empty()) return EVENT_QUEUE_UNKNOWN_ITEM;
    WorkItem& item = *node.mapped();
    if (WouldWaitForItself(item)) {
      const bool isOwn = item.RunningThread() == waiter.thread;
      item.End(WorkItem::FinishedBy::kOwnThread);
      m_ending.insert(std::move(node));  // moves the node: nothing to fail
      return isOwn ? EVENT_QUEUE_OK : EVENT_QUEUE_STILL_RUNNING;
    }
    item.End(WorkItem::FinishedBy::kCaller);
    waiter.item = &item;
    waiter.next = std::exchange(m_waiters, &waiter);
  }
  node.mapped()->Finish();
  RemoveWaiter(waiter);
  return EVENT_QUEUE_OK;
}

// Follows who waits for whom, from the thread that runs the item to the calling thread.
bool PeriodicQueue::WouldWaitForItself(const WorkItem& item) const {
  const DWORD self = GetCurrentThreadId();
  for (const WorkItem* next = &item; next != nullptr;) {
    const DWORD thread = next->RunningThread();
    if (thread == 0) return false;
    if (thread == self) return true;
    const Waiter* waiter = m_waiters;
    while (waiter != nullptr && waiter->thread != thread)
      waiter = waiter->next;
    next = waiter == nullptr ? nullptr : waiter->item;
  }
  return false;
}

void PeriodicQueue::RemoveWaiter(const Waiter& waiter) {
  const std::lock_guard lock(m_lock);
  Waiter** link = &m_waiters;
  while (*link != &waiter)
    link = &(*link)->next;
  *link = waiter.next;
}

// Takes what has ended on its own thread out of the queue. To be destroyed outside m_lock, for that waits.
PeriodicQueue::Items PeriodicQueue::TakeFinished() {
  Items finished;
  for (auto next = m_ending.begin(); next != m_ending.end();) {
    const auto item = next++;
    if (item->second->HasFinished()) finished.insert(m_ending.extract(item));
  }
  return finished;
}

bool PeriodicQueue::IsInsideCallback() const {
  const DWORD self = GetCurrentThreadId();
  const std::lock_guard lock(m_lock);
  const auto isRunByThis = [self](const auto& entry) { return entry.second->RunningThread() == self; };
  if (std::any_of(m_items.begin(), m_items.end(), isRunByThis)) return true;
  if (std::any_of(m_ending.begin(), m_ending.end(), isRunByThis)) return true;
  for (const Waiter* waiter = m_waiters; waiter != nullptr; waiter = waiter->next) {
    if (waiter->thread == self || waiter->item->RunningThread() == self) return true;
  }
  return false;
}

}  // namespace events
