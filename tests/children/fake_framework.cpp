// A framework library that fails in the way that the environment variable ST_FAKE_FRAMEWORK says: "null" makes no
// object and reports success, "refuse" makes a queue that takes no item, a number is what making an object answers.
#define ST_FRAMEWORK_EXPORTS
#include <cstdlib>
#include <string>

#include "interfaces/event_queue_api.h"

namespace {

int32_t Refuse(EventQueue*, const EventQueueItem*, EventQueueHandle* handle) {
  *handle = 0;
  return EVENT_QUEUE_SYSTEM_ERROR;
}

int32_t CancelNothing(EventQueue*, EventQueueHandle) {
  return EVENT_QUEUE_UNKNOWN_ITEM;
}

EventQueue g_queue = {&Refuse, &CancelNothing};

}  // namespace

int32_t QxCreateObject(const wchar_t*, uint32_t, void** object) {
  const char* const variable = std::getenv("ST_FAKE_FRAMEWORK");
  const std::string behaviour = variable == nullptr ? "9" : variable;
  *object = behaviour == "refuse" ? &g_queue : nullptr;
  return std::atoi(behaviour.c_str());  // 0 for the words
}

int32_t QxDestroyObject(void*) {
  return EVENT_QUEUE_OK;
}
