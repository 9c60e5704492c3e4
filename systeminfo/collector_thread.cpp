#include "systeminfo/collector_thread.h"

#include <algorithm>
#include <utility>

#include "core/abandoned_threads.h"
#include "core/lock.h"
#include "core/logging.h"
#include "systeminfo/collecting_settings.h"
#include "systeminfo/wmi_wrapper.h"

namespace systeminfo {
namespace {

using std::chrono::milliseconds;
using Clock = std::chrono::steady_clock;

constexpr milliseconds kCancelPoll{50};  // how late a collector hears that the run is cancelled

// A thread that was left behind keeps COM in use, and with it the security that an earlier connection set.
HRESULT WINAPI SetSecurityUnlessKept(PSECURITY_DESCRIPTOR descriptor, LONG count, SOLE_AUTHENTICATION_SERVICE* services,
                                     void* reserved1, DWORD authentication, DWORD impersonation, void* list,
                                     DWORD capabilities, void* reserved3) {
  const HRESULT status = CoInitializeSecurity(descriptor, count, services, reserved1, authentication, impersonation,
                                              list, capabilities, reserved3);
  return status == RPC_E_TOO_LATE && HasAbandonedThreads() ? S_OK : status;
}

}  // namespace

std::shared_ptr<WMIWrapper> ConnectToWmi() {
  auto wmi = std::make_shared<WMIWrapper>(&SetSecurityUnlessKept);
  return wmi->Init() == 0 ? wmi : nullptr;
}

// All that the thread touches. Both sides own it, so that it lasts as long as either of them.
struct CollectorThread::State {
  State(std::shared_ptr<CollectingSettings> runSettings, WmiMaker maker)
      : settings(std::move(runSettings)), connect(std::move(maker)) {}

  const std::shared_ptr<CollectingSettings> settings;
  const WmiMaker connect;
  std::atomic<bool> stop{false};  // the collectors' cancel flag
  std::atomic<bool> isAbandoned{false};

  SharedLock mutex;
  Condition changed;
  // Guarded by the mutex.
  bool isIdle = false;
  bool isConnected = false;
  bool isOver = false;                    // nothing more will be asked
  std::shared_ptr<ICollector> collector;  // the next one to run
  std::exception_ptr failure;             // of the last one

  void Main() noexcept;
  std::shared_ptr<ICollector> Next();
  void SetIdle(std::exception_ptr thrown);
};

void CollectorThread::State::Main() noexcept {
  const logging::CaptureGate gate(isAbandoned);
  std::shared_ptr<WMIWrapper> wmi;
  try {
    wmi = connect();
    isConnected = wmi != nullptr;  // nobody looks before the thread is idle
    if (!wmi) wmi = std::make_shared<WMIWrapper>(ComPtr<IWbemServices>());
    wmi->StopWaitingWhen(stop);
    SetIdle(nullptr);
  } catch (...) {
    SetIdle(std::current_exception());
  }
  while (const std::shared_ptr<ICollector> next = Next()) {
    std::exception_ptr thrown;
    try {
      next->Start(settings, wmi, &stop);
    } catch (...) {
      thrown = std::current_exception();
    }
    SetIdle(std::move(thrown));
  }
  wmi.reset();  // on the thread that made it
  SetIdle(nullptr);
}

std::shared_ptr<ICollector> CollectorThread::State::Next() {
  std::unique_lock lock(mutex);
  changed.wait(lock, [this] { return collector != nullptr || isOver; });
  return std::exchange(collector, nullptr);
}

void CollectorThread::State::SetIdle(std::exception_ptr thrown) {
  const std::lock_guard lock(mutex);
  failure = std::move(thrown);
  isIdle = true;
  changed.notify_all();
}

CollectorThread::CollectorThread(std::shared_ptr<CollectingSettings> settings, WmiMaker connect,
                                 const TimeLimits& limits, const std::atomic<bool>* cancel)
    : m_limits(limits),
      m_cancel(cancel),
      m_state(std::make_shared<State>(std::move(settings), std::move(connect))),
      m_thread([state = m_state] { state->Main(); }) {}

CollectorThread::~CollectorThread() {
  if (m_isAbandoned) return;
  {
    const std::lock_guard lock(m_state->mutex);
    m_state->isOver = true;
    m_state->isIdle = false;
    m_state->changed.notify_all();
  }
  if (WaitUntilIdle(m_limits.grace)) {
    m_thread.join();
  } else {
    LOG_ERROR(L"systeminfo::CollectorThread", L"the connection to WMI does not end and is left behind");
    Abandon();
  }
}

bool CollectorThread::AwaitConnection() {
  if (Await() == Ending::kAbandoned) return false;
  const std::lock_guard lock(m_state->mutex);
  if (m_state->failure) std::rethrow_exception(m_state->failure);
  return m_state->isConnected;
}

Ended CollectorThread::Run(const std::shared_ptr<ICollector>& collector) {
  {
    const std::lock_guard lock(m_state->mutex);
    m_state->stop = false;
    m_state->isIdle = false;
    m_state->collector = collector;
    m_state->changed.notify_all();
  }
  const Ending ending = Await();
  if (ending == Ending::kAbandoned) return {ending, nullptr};
  const std::lock_guard lock(m_state->mutex);
  return {ending, m_state->failure};
}

// Waits for what the thread does now, within the limits, and passes the run's cancellation on to it.
Ending CollectorThread::Await() {
  const bool isLimited = m_limits.budget != milliseconds::zero();
  Clock::time_point deadline = isLimited ? Clock::now() + m_limits.budget : Clock::time_point::max();
  bool isCancelled = false;
  while (!WaitUntilIdle(
      std::clamp(std::chrono::duration_cast<milliseconds>(deadline - Clock::now()), milliseconds{1}, kCancelPoll))) {
    if (!isCancelled && IsCancelled(m_cancel)) {
      isCancelled = true;
      m_state->stop = true;
      deadline = std::min(deadline, Clock::now() + m_limits.afterCancel);
    }
    if (Clock::now() < deadline) continue;
    m_state->stop = true;
    if (WaitUntilIdle(m_limits.grace)) return Ending::kLate;
    Abandon();
    return Ending::kAbandoned;
  }
  return Ending::kInTime;
}

bool CollectorThread::WaitUntilIdle(milliseconds limit) {
  std::unique_lock lock(m_state->mutex);
  return m_state->changed.wait_for(lock, limit, [this] { return m_state->isIdle; });
}

void CollectorThread::Abandon() {
  m_isAbandoned = true;
  m_state->isAbandoned = true;
  {
    const std::lock_guard lock(m_state->mutex);
    m_state->isOver = true;  // should it come back after all
  }
  m_thread.detach();
  NoteAbandonedThread();
}

}  // namespace systeminfo
