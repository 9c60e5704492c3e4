// The rules of monitoring that are functions over plain data.
#include <gmock/gmock.h>

#include <cmath>
#include <limits>

#include "core/json.h"
#include "monitoring/dump_budget.h"
#include "monitoring/dump_rules.h"
#include "monitoring/trigger_rules.h"

namespace st::monitoring {
namespace {

TEST(Condition, ComparesTheSampleWithTheThreshold) {
  constexpr double kNan = std::numeric_limits<double>::quiet_NaN();
  struct {
    const wchar_t* condition;
    double sample, threshold;
    bool holds;
  } const rows[] = {
      {L"<", 49.9, 50, true},   {L"<", 50, 50, false},     {L">", 50.1, 50, true},   {L">", 50, 50, false},
      {L"<=", 50, 50, true},    {L"<=", 50.1, 50, false},  {L">=", 50, 50, true},    {L">=", 49.9, 50, false},
      {L"=", 12.5, 12.5, true}, {L"=", 12.5, 12.6, false}, {L"", 50, 50, false},     {L"==", 50, 50, false},
      {L" <", 1, 50, false},    {L"<", kNan, 50, false},   {L">=", kNan, 50, false}, {L">", 13, 12.5, true},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(ConditionHolds(row.condition, row.sample, row.threshold), row.holds) << row.condition << row.sample;
  }
}

TEST(CountTick, CountsMatchesInTotalAndFiresOnTheLastOne) {
  struct {
    int32_t triggerAfter;
    std::vector<bool> matches;  // one for each tick
    int firesOnTick;            // 0: not at all
  } const rows[] = {
      {2, {true, false, true}, 3},
      {1, {false, false, true}, 3},
      {3, {true, true, false}, 0},
      {0, {false}, 1},
      {-5, {false}, 1},
      {INT32_MIN, {true}, 1},
      {INT32_MAX, {true, true}, 0},
  };
  for (const auto& row : rows) {
    int32_t count = 0;
    int firedOn = 0;
    for (size_t tick = 0; tick < row.matches.size() && firedOn == 0; ++tick) {
      if (CountTick(row.matches[tick], row.triggerAfter, count)) firedOn = static_cast<int>(tick) + 1;
    }
    EXPECT_EQ(firedOn, row.firesOnTick) << row.triggerAfter;
  }
}

TEST(DumpTarget, IsAProcessIdElseAPieceOfAPath) {
  struct {
    const char* json;
    std::optional<uint32_t> pid;
    const wchar_t* name;  // null: refused
  } const rows[] = {
      {R"({"pid":12})", 12, L""},
      {R"({"pid":12.9, "name":"x"})", 12, L""},
      {R"({"pid":4294967295})", 4294967295U, L""},
      {R"({"pid":-1})", 4294967295U, L""},
      {R"({"pid":null, "name":"x"})", std::nullopt, L"x"},
      {R"({"name":""})", std::nullopt, L""},
      {R"({"pid":4294967296})", std::nullopt, nullptr},
      {R"({"pid":1e400})", std::nullopt, nullptr},
      {R"({"pid":"12"})", std::nullopt, nullptr},
      {R"({"pid":true})", std::nullopt, nullptr},
      {R"({"name":7})", std::nullopt, nullptr},
      {R"({})", std::nullopt, nullptr},
      {R"([12])", std::nullopt, nullptr},
  };
  for (const auto& row : rows) {
    Json::Value parameters;
    std::string error;
    ASSERT_TRUE(ParseJson(row.json, parameters, error));
    int notes = 0;
    const auto target = ReadDumpTarget(parameters, [&notes](const Note&) { ++notes; });
    EXPECT_EQ(target.has_value(), row.name != nullptr) << row.json;
    EXPECT_EQ(notes, row.name == nullptr ? 1 : 0) << row.json;
    if (!target || row.name == nullptr) continue;
    EXPECT_EQ(target->pid, row.pid) << row.json;
    EXPECT_EQ(target->name, row.name) << row.json;
  }
}

std::string DumpBytes(std::initializer_list<uint32_t> numbers) {
  std::string bytes = "MDMP";
  for (const uint32_t number : numbers)
    bytes.append(reinterpret_cast<const char*>(&number), sizeof number);
  return bytes;
}

TEST(WholeDump, EveryStreamOfTheDirectoryIsInTheFile) {
  // Version, streams, directory, checksum, time, flags (8 bytes); then type, size and offset of each stream.
  const std::string dump = DumpBytes({0xA793, 2, 32, 0, 0, 0, 0, 4, 100, 56, 7, 44, 156});
  EXPECT_TRUE(IsWholeDump(dump, 200));
  EXPECT_FALSE(IsWholeDump(dump, 199));
  EXPECT_FALSE(IsWholeDump(dump, dump.size()));
  EXPECT_FALSE(IsWholeDump("", 0));
  EXPECT_FALSE(IsWholeDump(dump.substr(0, 31), 31));
  EXPECT_FALSE(IsWholeDump(std::string(200, '\0'), 200));
  EXPECT_FALSE(IsWholeDump(DumpBytes({0xA793, 0, 32, 0, 0, 0, 0}), 200)) << "a dump of nothing";
  EXPECT_FALSE(IsWholeDump(DumpBytes({0xA793, 0xFFFFFFFF, 32, 0, 0, 0, 0}), 200));
  EXPECT_TRUE(IsWholeDump(DumpBytes({0xA793, 1, 100'000, 0, 0, 0, 0}), 200'000)) << "the directory is out of sight";
  EXPECT_FALSE(IsWholeDump(DumpBytes({0xA793, 1, 32, 0, 0, 0, 0, 4, 0xFFFFFFFF, 0xFFFFFFFF}), 200));
}

TEST(DumpBudget, WithoutLimitsEveryDumpMayBeWritten) {
  DumpBudget budget({});
  for (int i = 0; i < 1000; ++i) {
    EXPECT_FALSE(budget.Begin(1, std::nullopt));
    EXPECT_FALSE(budget.Keep(uint64_t{1} << 60));
  }
}

TEST(DumpBudget, EachLimitRefusesAndNamesItself) {
  Limits limits;
  limits.maxDumps = 3;
  limits.maxDumpsPerProcess = 2;
  limits.minFreeDiskBytes = 1000;
  limits.maxTotalDumpBytes = 100;
  DumpBudget budget(limits);
  const auto begin = [&budget](uint32_t pid, std::optional<uint64_t> freeBytes) {
    return budget.Begin(pid, freeBytes).value_or(L"-");
  };
  EXPECT_EQ(begin(1, 999), L"minFreeDiskBytes is 1000 and 999 are free");
  EXPECT_EQ(begin(1, std::nullopt), L"minFreeDiskBytes is 1000 and the free space is unknown");
  EXPECT_EQ(begin(1, 1000), L"-");
  EXPECT_EQ(budget.Keep(60), std::nullopt);
  EXPECT_EQ(begin(1, 1000), L"-");
  EXPECT_EQ(budget.Keep(41), L"maxTotalDumpBytes is 100, there are 60 and this dump has 41");
  budget.GiveBack(1, 0);
  EXPECT_EQ(begin(1, 1000), L"-");
  EXPECT_EQ(begin(1, 1000), L"maxDumpsPerProcess is 2");
  EXPECT_EQ(begin(2, 1000), L"-");
  EXPECT_EQ(begin(3, 1000), L"maxDumps is 3");
  budget.GiveBack(2, 0);
  EXPECT_EQ(budget.Keep(40), std::nullopt);
  EXPECT_EQ(begin(3, 1000), L"maxTotalDumpBytes is 100");
  budget.GiveBack(1, 40);
  EXPECT_EQ(begin(3, 1000), L"-");
}

}  // namespace
}  // namespace st::monitoring
