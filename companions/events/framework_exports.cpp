// The exported functions: which objects the library makes, and which of them live.
#include <algorithm>
#include <memory>
#include <mutex>
#include <string_view>
#include <vector>

#include "companions/events/periodic_queue.h"
#include "core/lock.h"

namespace {

SharedLock g_lock;
std::vector<events::PeriodicQueue*> g_living;  // guarded by g_lock. No owners: a process may end without destroying

}  // namespace

int32_t QxCreateObject(const wchar_t* name, uint32_t interfaceId, void** object) {
  if (object == nullptr) return EVENT_QUEUE_BAD_ARGUMENT;
  *object = nullptr;
  if (name == nullptr) return EVENT_QUEUE_BAD_ARGUMENT;
  if (std::wstring_view(name) != EVENT_QUEUE_OBJECT_NAME) return EVENT_QUEUE_UNKNOWN_OBJECT;
  if (interfaceId != EVENT_QUEUE_INTERFACE_1) return EVENT_QUEUE_UNKNOWN_INTERFACE;
  try {
    auto made = std::make_unique<events::PeriodicQueue>();
    const std::lock_guard lock(g_lock);
    g_living.push_back(made.get());
    *object = static_cast<EventQueue*>(made.release());  // QxDestroyObject takes it back
    return EVENT_QUEUE_OK;
  } catch (...) {  // only memory can fail
    return EVENT_QUEUE_OUT_OF_MEMORY;
  }
}

int32_t QxDestroyObject(void* object) {
  if (object == nullptr) return EVENT_QUEUE_BAD_ARGUMENT;
  std::unique_ptr<events::PeriodicQueue> queue;
  {
    const std::lock_guard lock(g_lock);
    const auto found = std::find_if(g_living.begin(), g_living.end(), [object](events::PeriodicQueue* living) {
      return static_cast<EventQueue*>(living) == object;
    });
    if (found == g_living.end()) return EVENT_QUEUE_UNKNOWN_OBJECT;
    if ((*found)->IsInsideCallback()) return EVENT_QUEUE_INSIDE_CALLBACK;
    queue.reset(*found);
    g_living.erase(found);
  }
  return EVENT_QUEUE_OK;  // the queue goes here, outside the lock, for that waits
}
