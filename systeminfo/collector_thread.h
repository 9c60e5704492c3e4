// The thread on which a run's collectors work, one after another, with one connection to WMI. Its owner waits for each
// of them only so long. One that does not come back is left behind with its thread: the thread owns all that it uses,
// and what it may still do is seen by nobody. The rest of the run takes a new thread.
#pragma once

#include <atomic>
#include <chrono>
#include <exception>
#include <functional>
#include <memory>
#include <thread>

#include "systeminfo/collector.h"

namespace systeminfo {

struct TimeLimits {
  std::chrono::milliseconds budget = std::chrono::minutes(10);       // of one collector; 0: as long as it takes
  std::chrono::milliseconds grace = std::chrono::seconds(5);         // to end by itself when it is asked to
  std::chrono::milliseconds afterCancel = std::chrono::seconds(30);  // to end when the whole run is cancelled
};

// Makes a connection, on the thread that will use and destroy it. Null when there is none to be had.
using WmiMaker = std::function<std::shared_ptr<WMIWrapper>()>;

// The connection to the system's WMI.
std::shared_ptr<WMIWrapper> ConnectToWmi();

enum class Ending {
  kInTime,
  kLate,       // within the grace, so with whatever it had gathered
  kAbandoned,  // nothing of the collector may be touched any more
};

struct Ended {
  Ending ending = Ending::kInTime;
  std::exception_ptr failure;  // what the collector threw
};

class CollectorThread {
 public:
  // Begins to connect. `cancel` may be null and need not outlive this object. Throws std::system_error when there is no
  // thread to be had.
  CollectorThread(std::shared_ptr<CollectingSettings> settings, WmiMaker connect, const TimeLimits& limits,
                  const std::atomic<bool>* cancel);
  // Waits for the thread, and so for the connection's end, as long as the grace allows.
  ~CollectorThread();
  CollectorThread(const CollectorThread&) = delete;
  CollectorThread& operator=(const CollectorThread&) = delete;

  // Waits for the connection; first. False when there is none, or none within the budget; then the thread is left
  // behind. Without a connection collectors may run all the same; every query of theirs fails. Throws what the maker
  // threw; no collector may run then.
  bool AwaitConnection();

  // Runs one collector. Not after anything was abandoned.
  Ended Run(const std::shared_ptr<ICollector>& collector);

  bool IsAbandoned() const { return m_isAbandoned; }

 private:
  struct State;

  Ending Await();
  bool WaitUntilIdle(std::chrono::milliseconds limit);  // 0: without a limit
  void Abandon();

  const TimeLimits m_limits;
  const std::atomic<bool>* const m_cancel;
  const std::shared_ptr<State> m_state;
  std::thread m_thread;
  bool m_isAbandoned = false;
};

}  // namespace systeminfo
