// The library as the program has it: loaded at run time, by its exports only; and a queue with lambdas as callbacks.
#pragma once

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <functional>
#include <thread>

#include "core/dynamic_library.h"
#include "core/program_path.h"
#include "interfaces/event_queue_api.h"

struct FrameworkLibrary {
  DynamicLibrary library{(ProgramFolder() + L"\\framework.dll").c_str()};
  decltype(&QxCreateObject) create = library.Resolve<decltype(&QxCreateObject)>("QxCreateObject");
  decltype(&QxDestroyObject) destroy = library.Resolve<decltype(&QxDestroyObject)>("QxDestroyObject");
};

// What an item does. Must outlive the item, which is to say until `finishedCount` is 1.
struct Subscriber {
  std::function<void(EventQueueHandle)> onRun;
  std::function<void(EventQueueHandle)> onFinished;
  EventQueueHandle handle = 0;
  std::atomic<int> runCount{0};
  std::atomic<int> finishedCount{0};

  EventQueueItem Item(int32_t period) {
    return {sizeof(EventQueueItem), period, L"events_test", &Subscriber::Run, &Subscriber::Finished, this};
  }

 private:
  static void Run(void* user, EventQueueHandle handle) {
    auto& self = *static_cast<Subscriber*>(user);
    ++self.runCount;
    if (self.onRun) self.onRun(handle);
  }
  static void Finished(void* user, EventQueueHandle handle) {
    auto& self = *static_cast<Subscriber*>(user);
    if (self.onFinished) self.onFinished(handle);
    ++self.finishedCount;
  }
};

// False when the condition has not come true after a time that no working queue needs.
template <class Condition>
bool ComesTrue(Condition condition) {
  const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(20);
  while (!condition()) {
    if (std::chrono::steady_clock::now() > end) return false;
    std::this_thread::sleep_for(std::chrono::milliseconds(1));
  }
  return true;
}

inline void Pause(int milliseconds) {
  std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
}

class EventQueueTest : public testing::Test {
 protected:
  EventQueueTest() {
    void* object = nullptr;
    EXPECT_EQ(m_framework.create(EVENT_QUEUE_OBJECT_NAME, EVENT_QUEUE_INTERFACE_1, &object), EVENT_QUEUE_OK);
    m_queue = static_cast<EventQueue*>(object);
  }
  ~EventQueueTest() override {
    if (m_queue == nullptr) return;
    EXPECT_EQ(Destroy(), EVENT_QUEUE_OK);
  }

  int32_t Schedule(Subscriber& subscriber, int32_t period) const {
    const EventQueueItem item = subscriber.Item(period);
    return m_queue->SchedulePeriodic(m_queue, &item, &subscriber.handle);
  }
  int32_t Cancel(EventQueueHandle handle) const { return m_queue->Cancel(m_queue, handle); }

  int32_t Destroy() {
    const int32_t result = m_framework.destroy(m_queue);
    if (result == EVENT_QUEUE_OK) m_queue = nullptr;
    return result;
  }

  FrameworkLibrary m_framework;
  EventQueue* m_queue = nullptr;
};
