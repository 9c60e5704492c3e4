// Ends of items and queues: whichever thread asks for them, and whatever runs meanwhile.
#include <algorithm>
#include <memory>
#include <vector>

#include "companions/events/event_queue_test_library.h"

namespace {

TEST_F(EventQueueTest, CancelBeforeTheFirstRunOnlyFinishes) {
  Subscriber subscriber;
  DWORD finishedOn = 0;
  subscriber.onFinished = [&](EventQueueHandle) { finishedOn = GetCurrentThreadId(); };
  ASSERT_EQ(Schedule(subscriber, 3'600'000), EVENT_QUEUE_OK);
  EXPECT_EQ(Cancel(subscriber.handle), EVENT_QUEUE_OK);
  EXPECT_EQ(subscriber.runCount, 0);
  EXPECT_EQ(subscriber.finishedCount, 1);
  EXPECT_EQ(finishedOn, GetCurrentThreadId());
}

TEST_F(EventQueueTest, CancelFromItsOwnRunReturnsAtOnceAndFinishesAfterTheRun) {
  Subscriber subscriber;
  std::atomic<bool> isInside{false};
  std::atomic<int32_t> result{-1};
  std::atomic<int32_t> again{-1};
  std::atomic<DWORD> ranOn{0};
  std::atomic<DWORD> finishedOn{0};
  std::atomic<bool> finishedInside{false};
  subscriber.onRun = [&](EventQueueHandle handle) {
    isInside = true;
    result = Cancel(handle);
    again = Cancel(handle);
    Pause(20);
    ranOn = GetCurrentThreadId();
    isInside = false;
  };
  subscriber.onFinished = [&](EventQueueHandle handle) {
    finishedInside = isInside.load();
    finishedOn = handle == subscriber.handle ? GetCurrentThreadId() : 0;
  };
  ASSERT_EQ(Schedule(subscriber, 2), EVENT_QUEUE_OK);
  ASSERT_TRUE(ComesTrue([&] { return subscriber.finishedCount == 1; }));
  Pause(20);
  EXPECT_EQ(result, EVENT_QUEUE_OK);
  EXPECT_EQ(again, EVENT_QUEUE_UNKNOWN_ITEM);
  EXPECT_EQ(subscriber.runCount, 1);
  EXPECT_EQ(subscriber.finishedCount, 1);
  EXPECT_FALSE(finishedInside);
  EXPECT_EQ(finishedOn, ranOn);
  EXPECT_EQ(Cancel(subscriber.handle), EVENT_QUEUE_UNKNOWN_ITEM);
}

TEST_F(EventQueueTest, CancelFromAnotherThreadWaitsForTheRun) {
  Subscriber subscriber;
  std::atomic<bool> isInside{false};
  subscriber.onRun = [&](EventQueueHandle) {
    isInside = true;
    Pause(60);
    isInside = false;
  };
  ASSERT_EQ(Schedule(subscriber, 1), EVENT_QUEUE_OK);
  ASSERT_TRUE(ComesTrue([&] { return isInside.load(); }));
  EXPECT_EQ(Cancel(subscriber.handle), EVENT_QUEUE_OK);
  EXPECT_FALSE(isInside);
  EXPECT_EQ(subscriber.finishedCount, 1);
  const int runs = subscriber.runCount;
  Pause(20);
  EXPECT_EQ(subscriber.runCount, runs);
}

TEST_F(EventQueueTest, ItemsThatCancelEachOtherDoNotWaitForEver) {
  for (int round = 0; round < 50; ++round) {
    Subscriber one;
    Subscriber other;
    std::atomic<int> inside{0};
    std::atomic<int> results[2] = {-1, -1};
    const auto cancelWhenBothRun = [&](EventQueueHandle handle, std::atomic<int>& result) {
      ++inside;
      ComesTrue([&] { return inside == 2; });
      result = Cancel(handle);
    };
    one.onRun = [&](EventQueueHandle) { cancelWhenBothRun(other.handle, results[0]); };
    other.onRun = [&](EventQueueHandle) { cancelWhenBothRun(one.handle, results[1]); };
    ASSERT_EQ(Schedule(one, 3), EVENT_QUEUE_OK);
    ASSERT_EQ(Schedule(other, 3), EVENT_QUEUE_OK);
    ASSERT_TRUE(ComesTrue([&] { return one.finishedCount + other.finishedCount == 2; }));
    EXPECT_EQ(one.runCount + other.runCount, 2);
    EXPECT_EQ(std::min<int>(results[0], results[1]), EVENT_QUEUE_OK);
    EXPECT_EQ(std::max<int>(results[0], results[1]), EVENT_QUEUE_STILL_RUNNING);
  }
}

// Three threads and the item itself want it to end, at a moment that the rounds move across its runs.
TEST_F(EventQueueTest, OfManyCancelsOneSucceedsAndNothingRunsAfterIt) {
  for (int round = 0; round < 200; ++round) {
    Subscriber subscriber;
    std::atomic<int> succeeded{0};
    std::atomic<int> unknown{0};
    std::atomic<bool> go{false};
    std::atomic<bool> isOver{false};
    std::atomic<bool> ranAfterwards{false};
    const auto cancel = [&](EventQueueHandle handle) {
      const int32_t result = Cancel(handle);
      if (result == EVENT_QUEUE_OK) ++succeeded;
      if (result == EVENT_QUEUE_UNKNOWN_ITEM) ++unknown;
    };
    subscriber.onRun = [&](EventQueueHandle handle) {
      if (isOver) ranAfterwards = true;
      if (go) cancel(handle);
    };
    subscriber.onFinished = [&](EventQueueHandle) { isOver = true; };
    ASSERT_EQ(Schedule(subscriber, 1), EVENT_QUEUE_OK);
    std::vector<std::thread> threads;
    for (int i = 0; i < 3; ++i) {
      threads.emplace_back([&] {
        while (!go)
          std::this_thread::yield();
        cancel(subscriber.handle);
      });
    }
    Pause(round % 4);
    go = true;
    for (std::thread& thread : threads)
      thread.join();
    ASSERT_TRUE(ComesTrue([&] { return subscriber.finishedCount == 1; })) << round;
    EXPECT_EQ(succeeded, 1) << round;
    EXPECT_GE(unknown, 2) << round;
    EXPECT_FALSE(ranAfterwards) << round;
  }
}

TEST_F(EventQueueTest, RunsMayScheduleTheNextItem) {
  constexpr int kCount = 50;
  std::vector<Subscriber> subscribers(kCount);
  std::atomic<int> failures{0};
  for (int i = 0; i < kCount; ++i) {
    // Every second one schedules where it ends, the others where they run.
    const auto scheduleNext = [&, i](EventQueueHandle) {
      if (i + 1 < kCount && Schedule(subscribers[i + 1], 1) != EVENT_QUEUE_OK) ++failures;
    };
    subscribers[i].onRun = [&, i, scheduleNext](EventQueueHandle handle) {
      if (i % 2 == 0) scheduleNext(handle);
      if (Cancel(handle) != EVENT_QUEUE_OK) ++failures;
    };
    if (i % 2 != 0) subscribers[i].onFinished = scheduleNext;
  }
  ASSERT_EQ(Schedule(subscribers[0], 1), EVENT_QUEUE_OK);
  ASSERT_TRUE(ComesTrue([&] { return subscribers.back().finishedCount == 1; }));
  EXPECT_EQ(failures, 0);
  for (const Subscriber& subscriber : subscribers)
    EXPECT_EQ(subscriber.runCount, 1);
}

TEST_F(EventQueueTest, DestroyFromACallbackIsRefused) {
  std::atomic<int32_t> fromRun{-1};
  std::atomic<int32_t> fromFinished{-1};
  Subscriber subscriber;
  subscriber.onRun = [&](EventQueueHandle) { fromRun = m_framework.destroy(m_queue); };
  subscriber.onFinished = [&](EventQueueHandle) { fromFinished = m_framework.destroy(m_queue); };
  ASSERT_EQ(Schedule(subscriber, 1), EVENT_QUEUE_OK);
  ASSERT_TRUE(ComesTrue([&] { return subscriber.runCount >= 3; })) << "the queue goes on";
  EXPECT_EQ(Cancel(subscriber.handle), EVENT_QUEUE_OK);
  EXPECT_EQ(fromRun, EVENT_QUEUE_INSIDE_CALLBACK);
  EXPECT_EQ(fromFinished, EVENT_QUEUE_INSIDE_CALLBACK);
}

TEST_F(EventQueueTest, QueueThatIsBeingDestroyedTakesNoMore) {
  Subscriber late;
  std::atomic<int32_t> result{-1};
  std::atomic<bool> isInside{false};
  Subscriber subscriber;
  subscriber.onRun = [&](EventQueueHandle handle) {
    isInside = true;
    ComesTrue([&] {
      result = Schedule(late, 3'600'000);
      return Cancel(late.handle) != EVENT_QUEUE_OK && result == EVENT_QUEUE_CLOSING;
    });
    EXPECT_EQ(Cancel(handle), EVENT_QUEUE_UNKNOWN_ITEM) << "it ends already";
  };
  ASSERT_EQ(Schedule(subscriber, 1), EVENT_QUEUE_OK);
  ASSERT_TRUE(ComesTrue([&] { return isInside.load(); }));
  EXPECT_EQ(Destroy(), EVENT_QUEUE_OK);
  EXPECT_EQ(result, EVENT_QUEUE_CLOSING);
  EXPECT_EQ(subscriber.finishedCount, 1);
}

// Some end on their own, some are in a run, some wait for their time; then the library goes at once.
TEST(EventQueue, DestroyWaitsForEveryCallbackAndTheLibraryCanBeFreed) {
  for (int round = 0; round < 40; ++round) {
    auto framework = std::make_unique<FrameworkLibrary>();
    void* object = nullptr;
    ASSERT_EQ(framework->create(EVENT_QUEUE_OBJECT_NAME, EVENT_QUEUE_INTERFACE_1, &object), EVENT_QUEUE_OK);
    auto* const queue = static_cast<EventQueue*>(object);
    std::atomic<int> running{0};
    std::vector<Subscriber> subscribers(60);
    for (size_t i = 0; i < subscribers.size(); ++i) {
      subscribers[i].onRun = [&, i](EventQueueHandle handle) {
        ++running;
        if (i % 3 == 0) queue->Cancel(queue, handle);
        if (i % 3 == 1) Pause(3);
        --running;
      };
      const EventQueueItem item = subscribers[i].Item(1 + static_cast<int32_t>(i % 7));
      ASSERT_EQ(queue->SchedulePeriodic(queue, &item, &subscribers[i].handle), EVENT_QUEUE_OK);
    }
    Pause(round % 10);
    ASSERT_EQ(framework->destroy(queue), EVENT_QUEUE_OK);
    EXPECT_EQ(running, 0);
    framework.reset();
    ASSERT_EQ(GetModuleHandleW(L"framework.dll"), nullptr);
    for (const Subscriber& subscriber : subscribers)
      EXPECT_EQ(subscriber.finishedCount, 1);
  }
}

}  // namespace
