#include "companions/events/work_item.h"

#include <chrono>
#include <mutex>

#include "companions/events/beat.h"
#include "core/logging.h"

namespace events {
namespace {

using Ticks = std::chrono::duration<int64_t, std::ratio<1, 10'000'000>>;  // what timers are set in

int64_t Now() {
  return std::chrono::duration_cast<Ticks>(std::chrono::steady_clock::now().time_since_epoch()).count();
}

}  // namespace

WorkItem::WorkItem(const EventQueueItem& item)
    : m_period(Ticks(std::chrono::milliseconds(item.period_ms)).count()),
      m_subscriber(item.subscriber),
      m_run(item.run),
      m_finished(item.finished),
      m_user(item.user) {
  if (item.period_ms < kFinePeriod) m_fineTimers.emplace();
}

bool WorkItem::Prepare() {
  TP_CALLBACK_ENVIRON environment;
  InitializeThreadpoolEnvironment(&environment);
  SetThreadpoolCallbackRunsLong(&environment);
  m_timer.Reset(CreateThreadpoolTimer(&WorkItem::OnTimer, this, &environment));
  const DWORD error = GetLastError();
  DestroyThreadpoolEnvironment(&environment);
  SetLastError(error);
  return static_cast<bool>(m_timer);
}

void WorkItem::Start(EventQueueHandle handle) {
  const std::lock_guard lock(m_lock);
  m_handle = handle;
  if (m_hasEnded) return;
  const int64_t now = Now();
  m_due = now + m_period;
  SetTimer(now);
}

void WorkItem::End(FinishedBy finishedBy) {
  const std::lock_guard lock(m_lock);
  m_hasEnded = true;
  m_finishedBy = finishedBy;
}

void WorkItem::Finish() {
  m_timer.Reset();
  Call(m_finished);
}

void WorkItem::OnTimer(PTP_CALLBACK_INSTANCE, void* context, PTP_TIMER) {
  static_cast<WorkItem*>(context)->Tick();
}

void WorkItem::Tick() {
  if (!BeginRun()) return;
  Call(m_run);
  if (!EndRun()) return;
  Call(m_finished);
  m_runningThread = 0;
  m_hasFinished = true;
}

// False when the item ended meanwhile.
bool WorkItem::BeginRun() {
  const std::lock_guard lock(m_lock);
  if (m_hasEnded) return false;
  m_runningThread = GetCurrentThreadId();
  return true;
}

// True when it is for this thread to call `finished`. Otherwise the next run may already be under way on another
// thread when this returns.
bool WorkItem::EndRun() {
  const std::lock_guard lock(m_lock);
  if (m_hasEnded && m_finishedBy == FinishedBy::kOwnThread) return true;
  m_runningThread = 0;
  if (m_hasEnded) return false;
  const int64_t now = Now();
  m_due = NextDue(m_due, m_period, now);
  SetTimer(now);
  return false;
}

// Under m_lock, so that nothing sets the timer once the item has ended.
void WorkItem::SetTimer(int64_t now) {
  ULARGE_INTEGER relative;
  relative.QuadPart = static_cast<ULONGLONG>(now - m_due);  // negative: from now
  FILETIME due{relative.LowPart, relative.HighPart};
  SetThreadpoolTimer(m_timer.Get(), &due, 0, 0);
}

void WorkItem::Call(void (*callback)(void* user, EventQueueHandle handle)) noexcept {
  if (callback == nullptr) return;
  try {
    callback(m_user, m_handle);
  } catch (...) {
    if (!m_hasThrown.exchange(true)) {
      LOG_ERROR(L"GlobalEventQueue::WorkItem::Call", L"a callback of '%s' threw; more of that is not logged",
                m_subscriber.c_str());
    }
  }
}

}  // namespace events
