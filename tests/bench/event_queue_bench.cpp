// event_queue_bench ITEMS PERIOD_MS SECONDS: how well a queue keeps many short periods, and at what cost, against a
// thread for each item that sleeps until its next beat. Prints for each the median and the 99th percentile of how far
// the time between two runs was from the period, which part of the runs came, and how many processors it took.
#include <windows.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <thread>
#include <vector>

#include "core/dynamic_library.h"
#include "interfaces/event_queue_api.h"

namespace {

using Clock = std::chrono::steady_clock;

struct Plan {
  int items;
  int period;  // milliseconds
  int seconds;
};

// The times of one item's runs. Only that item's runs touch it.
struct Times {
  std::vector<Clock::time_point> times;
};

void Note(void* user, EventQueueHandle) {
  static_cast<Times*>(user)->times.push_back(Clock::now());
}

double ProcessorSeconds() {
  FILETIME creation{};
  FILETIME exit{};
  FILETIME kernel{};
  FILETIME user{};
  GetProcessTimes(GetCurrentProcess(), &creation, &exit, &kernel, &user);
  const auto seconds = [](const FILETIME& time) {
    return static_cast<double>((static_cast<uint64_t>(time.dwHighDateTime) << 32) | time.dwLowDateTime) / 1e7;
  };
  return seconds(kernel) + seconds(user);
}

std::vector<Times> Prepared(const Plan& plan) {
  std::vector<Times> all(static_cast<size_t>(plan.items));
  for (Times& item : all)
    item.times.reserve(static_cast<size_t>(plan.seconds) * 1100 / static_cast<size_t>(plan.period) + 100);
  return all;
}

// What the process spent from now on.
class Meter {
 public:
  double Seconds() const { return std::chrono::duration<double>(Clock::now() - m_begin).count(); }
  double Processors() const { return (ProcessorSeconds() - m_processorSeconds) / Seconds(); }

 private:
  Clock::time_point m_begin = Clock::now();
  double m_processorSeconds = ProcessorSeconds();
};

struct Cost {
  Clock::time_point end;  // later runs are not counted
  double seconds;
  double processors;
};

Cost Spent(const Meter& meter) {
  return {Clock::now(), meter.Seconds(), meter.Processors()};
}

bool Report(const char* who, const Plan& plan, const std::vector<Times>& all, const Cost& cost) {
  std::vector<double> errors;
  for (const Times& item : all) {
    for (size_t i = 1; i < item.times.size() && item.times[i] <= cost.end; ++i) {
      const std::chrono::duration<double, std::milli> between = item.times[i] - item.times[i - 1];
      errors.push_back(std::abs(between.count() - plan.period));
    }
  }
  if (errors.empty()) return false;
  std::sort(errors.begin(), errors.end());
  const double expected = 1000.0 * cost.seconds / plan.period * plan.items;
  std::printf("%s median_error_ms=%.3f p99_error_ms=%.3f runs=%.3f processors=%.3f\n", who, errors[errors.size() / 2],
              errors[errors.size() * 99 / 100], static_cast<double>(errors.size()) / expected, cost.processors);
  return true;
}

bool MeasureQueue(const Plan& plan) {
  const DynamicLibrary library(L"framework.dll");
  const auto create = library.Resolve<decltype(&QxCreateObject)>("QxCreateObject");
  const auto destroy = library.Resolve<decltype(&QxDestroyObject)>("QxDestroyObject");
  void* object = nullptr;
  if (create == nullptr || destroy == nullptr ||
      create(EVENT_QUEUE_OBJECT_NAME, EVENT_QUEUE_INTERFACE_1, &object) != EVENT_QUEUE_OK) {
    return false;
  }
  auto* const queue = static_cast<EventQueue*>(object);
  std::vector<Times> all = Prepared(plan);
  bool isComplete = true;
  const Meter meter;
  for (Times& times : all) {
    const EventQueueItem item{sizeof(EventQueueItem), plan.period, L"event_queue_bench", &Note, nullptr, &times};
    EventQueueHandle handle = 0;
    isComplete = queue->SchedulePeriodic(queue, &item, &handle) == EVENT_QUEUE_OK && isComplete;
  }
  std::this_thread::sleep_for(std::chrono::seconds(plan.seconds));
  const Cost cost = Spent(meter);
  destroy(queue);
  return isComplete && Report("queue", plan, all, cost);
}

// What is written first where there is no queue.
bool MeasureThreads(const Plan& plan) {
  std::vector<Times> all = Prepared(plan);
  std::atomic<bool> isOver{false};
  const Meter meter;
  std::vector<std::thread> threads;
  threads.reserve(all.size());
  for (Times& times : all) {
    threads.emplace_back([&] {
      for (Clock::time_point due = Clock::now(); !isOver;) {
        due += std::chrono::milliseconds(plan.period);
        std::this_thread::sleep_until(due);
        Note(&times, 0);
      }
    });
  }
  std::this_thread::sleep_for(std::chrono::seconds(plan.seconds));
  const Cost cost = Spent(meter);
  isOver = true;
  for (std::thread& thread : threads)
    thread.join();
  return Report("threads", plan, all, cost);
}

}  // namespace

int wmain(int argumentCount, wchar_t** arguments) {
  Plan plan{};
  if (argumentCount == 4) plan = {_wtoi(arguments[1]), _wtoi(arguments[2]), _wtoi(arguments[3])};
  if (plan.items < 1 || plan.period < 1 || plan.seconds < 1) {
    std::fputs("usage: event_queue_bench ITEMS PERIOD_MS SECONDS\n", stderr);
    return 2;
  }
  if (!MeasureQueue(plan) || !MeasureThreads(plan)) {
    std::fputs("the queue or the threads did not run\n", stderr);
    return 1;
  }
  return 0;
}
