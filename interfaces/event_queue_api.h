// The C interface of the framework library, `framework.dll`, as far as it is about its "GlobalEventQueue": an object
// that runs periodic work items on the threads of the system's thread pool. Each object made is a queue of its own;
// what all of them share is the pool.
//
// Any thread may call any function at any time, also from inside a callback, unless said otherwise. Text is UTF-16 and
// zero-terminated and copied before a function returns. Functions return an EventQueueResult and throw nothing.
//
// Order of unloading: QxDestroyObject for every object made, then FreeLibrary; neither from a callback or DllMain. A
// process may end without either.
#pragma once

#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#ifdef ST_FRAMEWORK_EXPORTS
#define ST_FRAMEWORK_API __declspec(dllexport)
#else
#define ST_FRAMEWORK_API
#endif

// What QxCreateObject is called with for a queue. A later version of EventQueue has another identifier; a library
// goes on making the older ones.
#define EVENT_QUEUE_OBJECT_NAME L"GlobalEventQueue"
#define EVENT_QUEUE_INTERFACE_1 1u

// Later versions may add numbers.
typedef enum EventQueueResult {
  EVENT_QUEUE_OK = 0,
  EVENT_QUEUE_BAD_ARGUMENT = 1,       // a null pointer, a period out of range, a size that no version has
  EVENT_QUEUE_UNKNOWN_OBJECT = 2,     // QxCreateObject: no object of this name; QxDestroyObject: no object that lives
  EVENT_QUEUE_UNKNOWN_INTERFACE = 3,  // the object is there, but not with this interface
  EVENT_QUEUE_UNKNOWN_ITEM = 4,       // no such item: its handle was never given out, or it was cancelled before
  EVENT_QUEUE_STILL_RUNNING = 5,      // cancelled, but not waited for: see `Cancel`
  EVENT_QUEUE_INSIDE_CALLBACK = 6,    // QxDestroyObject was called from a callback of this queue; nothing was done
  EVENT_QUEUE_CLOSING = 7,            // the queue is being destroyed and takes no more items
  EVENT_QUEUE_OUT_OF_MEMORY = 8,
  EVENT_QUEUE_SYSTEM_ERROR = 9  // the system makes no timer; GetLastError says why
} EventQueueResult;

// A work item as long as it is scheduled. Never 0, and never given out twice by one queue.
typedef uint64_t EventQueueHandle;

// Both are called on a thread of the pool, with no lock held, and may block. What they throw ends there: the item goes
// on, and the first such run of an item is logged. Hardware faults are not caught: they are for the crash handler.
//
// `run` is called once a period, first one period after scheduling. An item never overlaps itself: a run that takes
// longer than the period leaves out the ticks that it missed, and the item stays on its beat. Different items run at
// the same time.
//
// `finished` is called exactly once for each item that was scheduled, after its last run, when it was cancelled or its
// queue destroyed; `user` may be freed then. It runs on the thread that cancelled or destroyed, before that call
// returns; but on the item's own thread, right after the run, when the call did not wait for the run.
typedef void (*EventQueueRun)(void* user, EventQueueHandle handle);
typedef void (*EventQueueFinished)(void* user, EventQueueHandle handle);

// One periodic work item. Later versions may add fields at the end: a library takes a struct that is longer than its
// own, and takes what a shorter one lacks for zero.
typedef struct EventQueueItem {
  uint32_t size;                // sizeof(EventQueueItem)
  int32_t period_ms;            // milliseconds, 1 to INT32_MAX
  const wchar_t* subscriber;    // whose item it is, for the log. Not null
  EventQueueRun run;            // not null
  EventQueueFinished finished;  // or null
  void* user;                   // handed to both
} EventQueueItem;

// The queue: call its functions with itself as first argument. The memory is the library's.
typedef struct EventQueue EventQueue;
struct EventQueue {
  // Schedules a copy of `item`. `*handle` is written before the first run can begin, and is 0 after a failure.
  int32_t (*SchedulePeriodic)(EventQueue* queue, const EventQueueItem* item, EventQueueHandle* handle);

  // No further run begins. Waits for a run that is under way, so that when it returns EVENT_QUEUE_OK the callbacks are
  // done, with one exception: called from the item's own run it returns EVENT_QUEUE_OK at once, and `finished` follows
  // that run. Of two items of a queue whose runs cancel each other at the same time, the second would wait for ever: it
  // returns EVENT_QUEUE_STILL_RUNNING instead. An item that another thread is just cancelling is
  // EVENT_QUEUE_UNKNOWN_ITEM.
  int32_t (*Cancel)(EventQueue* queue, EventQueueHandle handle);
};

// Makes the object of this name. `*object` is of the type that the identifier stands for (EVENT_QUEUE_INTERFACE_1:
// EventQueue) and null after a failure.
ST_FRAMEWORK_API int32_t QxCreateObject(const wchar_t* name, uint32_t interfaceId, void** object);

// Cancels every item, waits for their callbacks and frees the object. No other thread may be inside a call on it, but
// for callbacks of its own.
ST_FRAMEWORK_API int32_t QxDestroyObject(void* object);

#ifdef __cplusplus
}
#endif
