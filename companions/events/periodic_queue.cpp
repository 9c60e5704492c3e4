#include "companions/events/periodic_queue.h"

#include <algorithm>
#include <utility>

#include "companions/events/beat.h"

namespace events {
namespace {

// What is due this soon is run now rather than have the timer set for it: with many items the timer, which is dear,
// comes at most once in this time.
constexpr int64_t kSlack = Ticks(std::chrono::microseconds(500)).count();

int64_t Now() {
  return std::chrono::duration_cast<Ticks>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

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

// Without the lock.
void Call(WorkItem& item, EventQueueRun callback) noexcept {
  if (callback == nullptr) return;
  try {
    callback(item.user, item.handle);
  } catch (...) {
    if (!std::exchange(item.hasThrown, true)) {
      LOG_ERROR(L"GlobalEventQueue::Call", L"a callback of '%s' threw; more of that is not logged",
                item.subscriber.c_str());
    }
  }
}

}  // namespace

// cppcheck-suppress uninitDerivedMemberVar ; both members of the base are initialised right here
PeriodicQueue::PeriodicQueue() : EventQueue{&OnSchedulePeriodic, &OnCancel} {}

PeriodicQueue::~PeriodicQueue() {
  Lock lock(m_lock);
  m_isClosing = true;
  m_due.clear();
  Items items = std::move(m_items);
  m_items.clear();
  for (const auto& [handle, item] : items)
    item->hasEnded = true;
  for (const auto& [handle, item] : items) {
    WaitForRun(*item);
    lock.unlock();
    Call(*item, item->finished);
    lock.lock();
  }
  // Those that finish themselves do so in a callback that closing m_work and m_timer waits for.
}

DWORD PeriodicQueue::Prepare() {
  TP_CALLBACK_ENVIRON environment;
  InitializeThreadpoolEnvironment(&environment);
  SetThreadpoolCallbackRunsLong(&environment);
  DWORD error = ERROR_SUCCESS;
  m_timer.Reset(CreateThreadpoolTimer(&PeriodicQueue::OnTimer, this, &environment));
  if (m_timer) m_work.Reset(CreateThreadpoolWork(&PeriodicQueue::OnWork, this, &environment));
  if (!m_work) error = GetLastError();
  DestroyThreadpoolEnvironment(&environment);
  if (error != ERROR_SUCCESS)
    LOG_ERROR(L"GlobalEventQueue::Prepare", L"the thread pool makes no timer, error %u", error);
  return error;
}

int32_t PeriodicQueue::Add(const EventQueueItem& item, EventQueueHandle& handle) {
  const std::lock_guard lock(m_lock);
  if (m_isClosing) return EVENT_QUEUE_CLOSING;
  auto made = std::make_unique<WorkItem>(item, m_lastHandle + 1);
  const int64_t now = Now();
  made->due = now + made->period;
  DueItems due{made.get()};
  m_items.emplace(made->handle, std::move(made));
  m_due.merge(due);  // takes the node over: nothing can fail
  handle = ++m_lastHandle;
  SendForNext(now);
  return EVENT_QUEUE_OK;
}

int32_t PeriodicQueue::Remove(EventQueueHandle handle) noexcept {
  Lock lock(m_lock);
  Items::node_type node = m_items.extract(handle);
  if (node.empty()) return EVENT_QUEUE_UNKNOWN_ITEM;
  WorkItem& item = *node.mapped();
  item.hasEnded = true;
  if (item.runningThread == 0) m_due.erase(&item);
  Waiter waiter{GetCurrentThreadId(), &item, m_waiters};
  if (WouldWaitForItself(item)) {
    item.finishesItself = true;
    m_ending.insert(std::move(node));  // takes the node over: nothing can fail
    return item.runningThread == waiter.thread ? EVENT_QUEUE_OK : EVENT_QUEUE_STILL_RUNNING;
  }
  m_waiters = &waiter;
  WaitForRun(item);
  lock.unlock();
  Call(item, item.finished);
  lock.lock();
  Waiter** link = &m_waiters;
  while (*link != &waiter)
    link = &(*link)->next;
  *link = waiter.next;
  return EVENT_QUEUE_OK;
}

void CALLBACK PeriodicQueue::OnTimer(PTP_CALLBACK_INSTANCE, void* context, PTP_TIMER) {
  auto& self = *static_cast<PeriodicQueue*>(context);
  Lock lock(self.m_lock);
  self.m_timerDue = kNever;
  self.RunWhatIsDue(lock);
}

void CALLBACK PeriodicQueue::OnWork(PTP_CALLBACK_INSTANCE, void* context, PTP_WORK) {
  auto& self = *static_cast<PeriodicQueue*>(context);
  Lock lock(self.m_lock);
  self.m_isThreadUnderWay = false;
  self.RunWhatIsDue(lock);
}

void PeriodicQueue::RunWhatIsDue(Lock& lock) {
  int64_t now = Now();
  while (!m_due.empty() && (*m_due.begin())->due <= now + kSlack) {
    RunFirst(lock, now);
    now = Now();
  }
  SendForNext(now);
}

// Sees to it that a thread will come for what is due first, whatever the calling one is about to do.
void PeriodicQueue::SendForNext(int64_t now) {
  if (m_due.empty()) return;
  const int64_t due = (*m_due.begin())->due;
  if (due <= now + kSlack) {
    if (!std::exchange(m_isThreadUnderWay, true)) SubmitThreadpoolWork(m_work.Get());
    return;
  }
  if (due >= m_timerDue) return;
  m_timerDue = due;
  ULARGE_INTEGER relative;
  relative.QuadPart = static_cast<ULONGLONG>(now - due);  // negative: from now
  FILETIME time{relative.LowPart, relative.HighPart};
  SetThreadpoolTimer(m_timer.Get(), &time, 0, 0);
}

void PeriodicQueue::RunFirst(Lock& lock, int64_t now) {
  DueItems::node_type node = m_due.extract(m_due.begin());
  WorkItem& item = *node.value();
  item.runningThread = GetCurrentThreadId();
  SendForNext(now);
  lock.unlock();
  Call(item, item.run);
  lock.lock();
  if (!item.hasEnded) {
    item.runningThread = 0;
    item.due = NextDue(item.due, item.period, Now());
    m_due.insert(std::move(node));  // takes the node over: nothing can fail
  } else if (item.finishesItself) {
    lock.unlock();
    Call(item, item.finished);
    lock.lock();
    m_ending.erase(item.handle);
    WakeAllConditionVariable(&m_ended);
  } else {
    item.runningThread = 0;
    WakeAllConditionVariable(&m_ended);
  }
}

void PeriodicQueue::WaitForRun(const WorkItem& item) {
  while (item.runningThread != 0)
    m_lock.Wait(m_ended);
}

// Follows who waits for whom, from the thread that runs the item to the calling thread.
bool PeriodicQueue::WouldWaitForItself(const WorkItem& item) const {
  const DWORD self = GetCurrentThreadId();
  for (const WorkItem* next = &item; next != nullptr;) {
    const DWORD thread = next->runningThread;
    if (thread == 0) return false;
    if (thread == self) return true;
    const Waiter* waiter = m_waiters;
    while (waiter != nullptr && waiter->thread != thread)
      waiter = waiter->next;
    next = waiter == nullptr ? nullptr : waiter->item;
  }
  return false;
}

bool PeriodicQueue::IsInsideCallback() const {
  const DWORD self = GetCurrentThreadId();
  const std::lock_guard lock(m_lock);
  const auto isRunByThis = [self](const auto& entry) { return entry.second->runningThread == self; };
  if (std::any_of(m_items.begin(), m_items.end(), isRunByThis)) return true;
  if (std::any_of(m_ending.begin(), m_ending.end(), isRunByThis)) return true;
  for (const Waiter* waiter = m_waiters; waiter != nullptr; waiter = waiter->next) {
    if (waiter->thread == self || waiter->item->runningThread == self) return true;
  }
  return false;
}

}  // namespace events
