#include "monitoring/performance_counter.h"

#include <gmock/gmock.h>

#include "core/logging.h"
#include "monitoring/scripted_counter.h"
#include "monitoring/trigger.h"

namespace st::monitoring {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

CounterSettings Settings(const wchar_t* query) {
  return {L"c", query, 1000, false, {}};
}

Trigger MakeTrigger(const wchar_t* condition, double threshold) {
  return Trigger({L"t", 1, threshold, condition, {}});
}

TEST(PerformanceCounter, ACounterThatTheSystemLacksLoadsAndNeverReads) {
  logging::ErrorCapture errors;
  PerformanceCounter counter(Settings(L"\\No such object\\No such counter"), MakePdhQuery());
  EXPECT_THAT(errors.Take(), ElementsAre(testing::StartsWith(L"st::monitoring::PerformanceCounter::Init: "
                                                             L"PdhAddCounter -")));
  EXPECT_FALSE(counter.CollectQueryData());
  double value = 7;
  EXPECT_FALSE(counter.GetCounterValue(value));
  EXPECT_EQ(value, 7);
  EXPECT_THAT(errors.Take(), ElementsAre(testing::StartsWith(
                                 L"st::monitoring::PerformanceCounter::GetCounterValue: PdhGetFormattedCounterValue "
                                 L"returned -")));
  EXPECT_FALSE(MakeTrigger(L">=", -1e300).Evaluate(counter));
}

TEST(PerformanceCounter, AQueryThatIsNotOpenIsNeverHandedToTheSystem) {
  const auto query = MakePdhQuery();
  double value = 7;
  EXPECT_LT(query->AddCounter(L"\\System\\System Up Time"), 0);
  EXPECT_LT(query->Collect(), 0);
  EXPECT_LT(query->GetValue(value), 0);
}

// Counters that every system has, also one that has few.
TEST(PerformanceCounter, TheSystemsUptimeGrowsAndItsProcessorTimeIsANumber) {
  logging::ErrorCapture errors;
  PerformanceCounter uptime(Settings(L"\\System\\System Up Time"), MakePdhQuery());
  PerformanceCounter processor(Settings(L"\\Processor(_Total)\\% Processor Time"), MakePdhQuery());
  EXPECT_THAT(errors.Take(), IsEmpty());
  double first = -1, second = -1, busy = -1;
  ASSERT_TRUE(uptime.CollectQueryData() && processor.CollectQueryData());
  ASSERT_TRUE(uptime.GetCounterValue(first));
  Sleep(1100);  // whole seconds on some systems
  ASSERT_TRUE(uptime.CollectQueryData() && processor.CollectQueryData());
  ASSERT_TRUE(uptime.GetCounterValue(second));
  ASSERT_TRUE(processor.GetCounterValue(busy));
  EXPECT_GT(second, first);
  EXPECT_GE(busy, 0);
  EXPECT_LE(busy, 100);
  EXPECT_TRUE(MakeTrigger(L">", first).Evaluate(uptime));
  EXPECT_FALSE(MakeTrigger(L"<", first).Evaluate(uptime));
}

TEST(Trigger, EvaluatesTheSampleThatItTakesItself) {
  const CounterScripts scripts = {{L"x", {60, 40, std::nullopt, 50}}};
  PerformanceCounter counter(Settings(L"x"), std::make_unique<ScriptedCounter>(scripts));
  const Trigger trigger = MakeTrigger(L">=", 50);
  for (const bool matches : {true, false, false, true})
    EXPECT_EQ(trigger.Evaluate(counter), matches);
}

}  // namespace
}  // namespace st::monitoring
