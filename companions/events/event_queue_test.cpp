// What a queue does with its items: when they run, on what they are refused, what becomes of what they throw.
#include <gmock/gmock.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <mutex>
#include <stdexcept>
#include <vector>

#include "companions/events/event_queue_test_library.h"
#include "interfaces/log_api.h"
#include "tests/support/log_text.h"
#include "tests/support/test_folder.h"

namespace {

using Clock = std::chrono::steady_clock;

double Milliseconds(Clock::duration duration) {
  return std::chrono::duration<double, std::milli>(duration).count();
}

TEST_F(EventQueueTest, FirstRunComesAfterOnePeriodAndTheOthersOnItsBeat) {
  constexpr int kPeriod = 40;
  std::vector<double> times;  // only its own runs touch it
  Subscriber subscriber;
  const Clock::time_point begin = Clock::now();
  subscriber.onRun = [&](EventQueueHandle) { times.push_back(Milliseconds(Clock::now() - begin)); };
  ASSERT_EQ(Schedule(subscriber, kPeriod), EVENT_QUEUE_OK);
  ASSERT_TRUE(ComesTrue([&] { return subscriber.runCount >= 20; }));
  EXPECT_EQ(Cancel(subscriber.handle), EVENT_QUEUE_OK);

  EXPECT_GT(times.front(), kPeriod - 5.0);
  std::vector<double> off;  // how far from the nearest beat
  for (const double time : times)
    off.push_back(std::abs(std::remainder(time, kPeriod)));
  std::nth_element(off.begin(), off.begin() + 10, off.end());
  EXPECT_LT(off[10], 5.0) << "a schedule that drifts is off by 10 on average";
}

TEST_F(EventQueueTest, RunThatTakesLongerThanThePeriodLeavesBeatsOutAndNeverOverlaps) {
  std::atomic<int> running{0};
  std::atomic<int> most{0};
  Subscriber subscriber;
  subscriber.onRun = [&](EventQueueHandle) {
    most = std::max<int>(most, ++running);
    Pause(25);
    --running;
  };
  const Clock::time_point begin = Clock::now();
  ASSERT_EQ(Schedule(subscriber, 10), EVENT_QUEUE_OK);
  ASSERT_TRUE(ComesTrue([&] { return subscriber.runCount >= 10; }));
  EXPECT_EQ(Cancel(subscriber.handle), EVENT_QUEUE_OK);
  EXPECT_EQ(most, 1);
  EXPECT_EQ(running, 0);
  EXPECT_GT(Milliseconds(Clock::now() - begin), 10 * 27.0) << "missed beats are not made up for";
}

TEST_F(EventQueueTest, DifferentItemsRunAtTheSameTime) {
  constexpr int kCount = 8;  // more than the machine has processors
  std::atomic<int> inside{0};
  std::atomic<bool> wereTogether{false};
  std::vector<Subscriber> subscribers(kCount);
  for (Subscriber& subscriber : subscribers) {
    subscriber.onRun = [&](EventQueueHandle) {
      if (++inside == kCount) wereTogether = true;
      ComesTrue([&] { return wereTogether.load(); });
      --inside;
    };
    ASSERT_EQ(Schedule(subscriber, 5), EVENT_QUEUE_OK);
  }
  EXPECT_TRUE(ComesTrue([&] { return wereTogether.load(); }));
  EXPECT_EQ(Destroy(), EVENT_QUEUE_OK);
}

TEST_F(EventQueueTest, ThousandItemsKeepTheirPeriodWhileOthersBlock) {
  std::vector<Subscriber> blocking(16);
  std::vector<Subscriber> subscribers(1000);
  for (Subscriber& subscriber : blocking) {
    subscriber.onRun = [](EventQueueHandle) { Pause(300); };
    ASSERT_EQ(Schedule(subscriber, 1), EVENT_QUEUE_OK);
  }
  for (Subscriber& subscriber : subscribers)
    ASSERT_EQ(Schedule(subscriber, 20), EVENT_QUEUE_OK);
  Pause(1000);
  EXPECT_EQ(Destroy(), EVENT_QUEUE_OK);
  int fewest = std::numeric_limits<int>::max();
  for (const Subscriber& subscriber : subscribers) {
    fewest = std::min<int>(fewest, subscriber.runCount);
    EXPECT_EQ(subscriber.finishedCount, 1);
  }
  EXPECT_GE(fewest, 10) << "50 on an idle machine";
}

TEST_F(EventQueueTest, PeriodsOfAnyLengthAreTakenAndOthersAreRefused) {
  for (const int32_t period : {0, -1, std::numeric_limits<int32_t>::min()}) {
    Subscriber subscriber;
    subscriber.handle = 77;
    EXPECT_EQ(Schedule(subscriber, period), EVENT_QUEUE_BAD_ARGUMENT) << period;
    EXPECT_EQ(subscriber.handle, 0u);
    EXPECT_EQ(subscriber.finishedCount, 0) << "it was never scheduled";
  }
  Subscriber shortest;
  ASSERT_EQ(Schedule(shortest, 1), EVENT_QUEUE_OK);
  Subscriber longest;
  ASSERT_EQ(Schedule(longest, std::numeric_limits<int32_t>::max()), EVENT_QUEUE_OK);
  EXPECT_TRUE(ComesTrue([&] { return shortest.runCount > 50; }));
  EXPECT_EQ(Destroy(), EVENT_QUEUE_OK);
  EXPECT_EQ(longest.runCount, 0);
  EXPECT_EQ(longest.finishedCount, 1);
}

TEST_F(EventQueueTest, ItemsThatLackWhatTheyNeedAreRefused) {
  struct {
    const char* what;
    void (*spoil)(EventQueueItem& item);
    int32_t expected;
  } const rows[] = {
      {"as it should be", [](EventQueueItem&) {}, EVENT_QUEUE_OK},
      {"of a later version", [](EventQueueItem& item) { item.size += 24; }, EVENT_QUEUE_OK},
      {"nobody wants to know of its end", [](EventQueueItem& item) { item.finished = nullptr; }, EVENT_QUEUE_OK},
      {"no size", [](EventQueueItem& item) { item.size = 0; }, EVENT_QUEUE_BAD_ARGUMENT},
      {"shorter than any version", [](EventQueueItem& item) { --item.size; }, EVENT_QUEUE_BAD_ARGUMENT},
      {"no subscriber", [](EventQueueItem& item) { item.subscriber = nullptr; }, EVENT_QUEUE_BAD_ARGUMENT},
      {"nothing to run", [](EventQueueItem& item) { item.run = nullptr; }, EVENT_QUEUE_BAD_ARGUMENT},
  };
  Subscriber subscriber;
  for (const auto& row : rows) {
    EventQueueItem item = subscriber.Item(1000);
    row.spoil(item);
    EventQueueHandle handle = 77;
    EXPECT_EQ(m_queue->SchedulePeriodic(m_queue, &item, &handle), row.expected) << row.what;
    EXPECT_EQ(handle != 0, row.expected == EVENT_QUEUE_OK) << row.what;
    EXPECT_EQ(Cancel(handle), handle != 0 ? EVENT_QUEUE_OK : EVENT_QUEUE_UNKNOWN_ITEM) << row.what;
  }
  const EventQueueItem item = subscriber.Item(1000);
  EventQueueHandle handle = 77;
  EXPECT_EQ(m_queue->SchedulePeriodic(nullptr, &item, &handle), EVENT_QUEUE_BAD_ARGUMENT);
  EXPECT_EQ(handle, 0u);
  EXPECT_EQ(m_queue->SchedulePeriodic(m_queue, nullptr, &handle), EVENT_QUEUE_BAD_ARGUMENT);
  EXPECT_EQ(m_queue->SchedulePeriodic(m_queue, &item, nullptr), EVENT_QUEUE_BAD_ARGUMENT);
  EXPECT_EQ(m_queue->Cancel(nullptr, 1), EVENT_QUEUE_BAD_ARGUMENT);
}

TEST_F(EventQueueTest, HandlesAreNeverGivenOutTwice) {
  std::vector<EventQueueHandle> handles;
  Subscriber subscriber;
  for (int i = 0; i < 20; ++i) {
    ASSERT_EQ(Schedule(subscriber, 1000), EVENT_QUEUE_OK);
    EXPECT_THAT(handles, testing::Not(testing::Contains(subscriber.handle)));
    handles.push_back(subscriber.handle);
    if (i % 2 == 0) {
      EXPECT_EQ(Cancel(subscriber.handle), EVENT_QUEUE_OK);
      EXPECT_EQ(Cancel(subscriber.handle), EVENT_QUEUE_UNKNOWN_ITEM);
    }
  }
  EXPECT_EQ(Cancel(handles.back() + 1), EVENT_QUEUE_UNKNOWN_ITEM);
  EXPECT_EQ(Destroy(), EVENT_QUEUE_OK);
  EXPECT_EQ(subscriber.finishedCount, 20);
}

TEST(QxCreateObject, MakesNothingButQueuesAndTakesBackWhatItMade) {
  const FrameworkLibrary framework;
  struct {
    const wchar_t* name;
    uint32_t interfaceId;
    int32_t expected;
  } const rows[] = {
      {nullptr, EVENT_QUEUE_INTERFACE_1, EVENT_QUEUE_BAD_ARGUMENT},
      {L"", EVENT_QUEUE_INTERFACE_1, EVENT_QUEUE_UNKNOWN_OBJECT},
      {L"globaleventqueue", EVENT_QUEUE_INTERFACE_1, EVENT_QUEUE_UNKNOWN_OBJECT},
      {L"GlobalEventQueue2", EVENT_QUEUE_INTERFACE_1, EVENT_QUEUE_UNKNOWN_OBJECT},
      {L"GlobalEventQueue", 0, EVENT_QUEUE_UNKNOWN_INTERFACE},
      {L"GlobalEventQueue", 2, EVENT_QUEUE_UNKNOWN_INTERFACE},
  };
  int other = 0;
  for (const auto& row : rows) {
    void* object = &other;
    EXPECT_EQ(framework.create(row.name, row.interfaceId, &object), row.expected);
    EXPECT_EQ(object, nullptr);
  }
  EXPECT_EQ(framework.create(EVENT_QUEUE_OBJECT_NAME, EVENT_QUEUE_INTERFACE_1, nullptr), EVENT_QUEUE_BAD_ARGUMENT);
  EXPECT_EQ(framework.destroy(nullptr), EVENT_QUEUE_BAD_ARGUMENT);
  EXPECT_EQ(framework.destroy(&other), EVENT_QUEUE_UNKNOWN_OBJECT);

  void* object = nullptr;
  ASSERT_EQ(framework.create(EVENT_QUEUE_OBJECT_NAME, EVENT_QUEUE_INTERFACE_1, &object), EVENT_QUEUE_OK);
  EXPECT_EQ(framework.destroy(object), EVENT_QUEUE_OK);
  EXPECT_EQ(framework.destroy(object), EVENT_QUEUE_UNKNOWN_OBJECT);
}

// The library writes through the same log.dll, which this process sets up.
TEST_F(EventQueueTest, ItemThatThrowsGoesOnAndIsLoggedOnce) {
  const TestFolder folder;
  const DynamicLibrary log((ProgramFolder() + L"\\log.dll").c_str());
  ASSERT_EQ(log.Resolve<decltype(&LogEnable)>("LogEnable")(1), 0);
  ASSERT_EQ(log.Resolve<decltype(&LogSetPath)>("LogSetPath")(folder.Path().c_str()), 0);
  Subscriber subscriber;
  subscriber.onRun = [](EventQueueHandle) { throw std::runtime_error("of a subscriber"); };
  subscriber.onFinished = [](EventQueueHandle) { throw 7; };
  ASSERT_EQ(Schedule(subscriber, 1), EVENT_QUEUE_OK);
  EXPECT_TRUE(ComesTrue([&] { return subscriber.runCount >= 5; }));
  EXPECT_EQ(Cancel(subscriber.handle), EVENT_QUEUE_OK);
  log.Resolve<decltype(&LogSetPath)>("LogSetPath")(L"");

  int lines = 0;
  for (const std::string& line : Lines(LogText(folder.Path(L"events_test.log")))) {
    if (TextOf(line) == "a callback of 'events_test' threw; more of that is not logged") ++lines;
  }
  EXPECT_EQ(lines, 1);
}

}  // namespace
