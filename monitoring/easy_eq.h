// The program's side of the framework library's event queue: loads the library, makes the queue and owns the work items
// that are scheduled on it. Without it monitoring does not start.
#pragma once

#include <windows.h>

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

#include "core/dynamic_library.h"
#include "interfaces/event_queue_api.h"

namespace st::monitoring {

// What runs once a period, on a thread of the queue. It never runs twice at one time. What it throws is logged.
class EqWorkItem {
 public:
  virtual ~EqWorkItem() = default;
  virtual void Run() = 0;
};

class EasyEQ;

// A scheduled work item; exists until the queue is done with it.
class EasyEQTask {
 public:
  EasyEQTask(EasyEQ& owner, std::unique_ptr<EqWorkItem> item) : m_owner(owner), m_item(std::move(item)) {}

  EasyEQ& Owner() const { return m_owner; }
  void Run() const noexcept;

 private:
  EasyEQ& m_owner;
  const std::unique_ptr<EqWorkItem> m_item;
};

class EasyEQ {
 public:
  EasyEQ() = default;
  ~EasyEQ();
  EasyEQ(const EasyEQ&) = delete;
  EasyEQ& operator=(const EasyEQ&) = delete;

  // Loads the library from its full path and makes the queue. 0, or an error code, which is one of the system's or of
  // EventQueueResult; nothing is left loaded then.
  int32_t Init(const std::wstring& libraryPath);

  // Runs the item once every `periodMs` milliseconds until it is cancelled. The handle is written before the first run
  // and is 0 after a failure, which is logged.
  bool Schedule(const wchar_t* subscriber, int32_t periodMs, std::unique_ptr<EqWorkItem> item,
                EventQueueHandle& handle);

  // No further run begins. Waits for a run under way, but not for the item's own. One that is cancelled already is left
  // alone.
  void Cancel(EventQueueHandle handle);

  // Cancels everything, waits for the runs under way and destroys the queue. Not from inside a work item.
  void Close();

 private:
  // The queue's callbacks; their user data is one of m_tasks.
  static void OnRun(void* user, EventQueueHandle handle);
  static void OnFinished(void* user, EventQueueHandle handle);
  void Remove(const EasyEQTask* task);

  DynamicLibrary m_library;
  decltype(&QxDestroyObject) m_destroyObject = nullptr;
  EventQueue* m_queue = nullptr;
  std::mutex m_mutex;
  std::map<const EasyEQTask*, std::unique_ptr<EasyEQTask>> m_tasks;  // guarded by m_mutex
};

}  // namespace st::monitoring
