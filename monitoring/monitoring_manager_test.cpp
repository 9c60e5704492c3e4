#include "monitoring/monitoring_manager.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <thread>

#include "core/logging.h"
#include "core/program_path.h"
#include "monitoring/scripted_counter.h"
#include "tests/support/log_text.h"
#include "tests/support/test_folder.h"

namespace st::monitoring {
namespace {

using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;

std::string Counter(const std::string& id, const std::string& triggers, const std::string& more = {}) {
  return R"({"id":")" + id + R"(", "query":")" + id + R"(", "sampleInterval":5, "triggers":[)" + triggers + "]" + more +
         "}";
}

std::string TriggerText(const std::string& id, int after, const std::string& condition,
                        const std::string& actions = {}) {
  return R"({"id":")" + id + R"(", "triggerAfter":)" + std::to_string(after) + R"(, "counterValue":50, "condition":")" +
         condition + R"(", "action":[)" + actions + "]}";
}

std::string Document(const std::string& counters, const std::string& triggers, const std::string& actions = {}) {
  return R"({"performanceCounters":[)" + counters + R"(], "triggers":[)" + triggers + R"(], "actions":[)" + actions +
         "]}";
}

// Runs whole configurations in a folder of their own, with scripted counters and the real event queue.
class ManagerTest : public testing::Test {
 protected:
  ManagerTest() : m_in(m_folder.Path()) {}

  std::unique_ptr<MonitoringManager> Manager(const std::string& configuration) {
    m_folder.MakeFile(L"monitoring.json", configuration);
    const Surroundings surroundings{[this] { return std::make_unique<ScriptedCounter>(m_scripts); }, m_writer,
                                    m_framework};
    return std::make_unique<MonitoringManager>(m_folder.Path(L"monitoring.json"), surroundings);
  }

  // The lines that `function` of the manager wrote, without its name.
  std::vector<std::wstring> LinesOf(const wchar_t* function) {
    const std::wstring start = L"st::monitoring::MonitoringManager::" + std::wstring(function) + L": ";
    const std::vector<std::wstring> taken = m_log.Take();
    m_lines.insert(m_lines.end(), taken.begin(), taken.end());
    std::vector<std::wstring> found;
    for (const std::wstring& line : m_lines) {
      if (line.starts_with(start)) found.push_back(line.substr(start.size()));
    }
    return found;
  }

  const TestFolder m_folder;
  const CurrentFolder m_in;
  CounterScripts m_scripts;
  MiniDumpWriter m_writer = [](HANDLE, DWORD, HANDLE) -> DWORD { return ERROR_DISK_FULL; };
  std::wstring m_framework = ProgramFolder() + L"\\framework.dll";
  logging::ErrorCapture m_log{logging::Level::kTrace};
  std::vector<std::wstring> m_lines;
};

// Two collections a tick: the first is what the log shows, the second what is compared.
TEST_F(ManagerTest, MatchesAreCountedInTotalAndTheRunEndsByItself) {
  m_scripts[L"c"] = {1, 60, 2, 40, 3, 70};
  const auto manager = Manager(Document(Counter("c", R"("t")"), TriggerText("t", 2, ">")));
  ASSERT_TRUE(manager->Init());
  EXPECT_TRUE(manager->Start());
  EXPECT_THAT(LinesOf(L"Tick"), ElementsAre(L"[c,t] UPDATE; cnt = 1; value = 1.000000",
                                            L"[c,t] UPDATE; cnt = 2; value = 3.000000", L"[c,t] TRIGGER"));
  EXPECT_THAT(LinesOf(L"Start"), ElementsAre(L"stop signaled"));
}

TEST_F(ManagerTest, TheRunEndsWhenTheLastPairHasFired) {
  m_scripts[L"fast"] = {60};
  m_scripts[L"slow"] = std::vector<std::optional<double>>(20, 40.0);
  m_scripts[L"slow"].push_back(60.0);
  const auto manager =
      Manager(Document(Counter("fast", R"("t")") + "," + Counter("slow", R"("t")"), TriggerText("t", 1, ">")));
  ASSERT_TRUE(manager->Init());
  EXPECT_TRUE(manager->Start());
  EXPECT_THAT(LinesOf(L"Tick"), ElementsAre(L"[fast,t] UPDATE; cnt = 1; value = 60.000000", L"[fast,t] TRIGGER",
                                            testing::StartsWith(L"[slow,t] UPDATE; cnt = 1"), L"[slow,t] TRIGGER"));
  EXPECT_THAT(LinesOf(L"Start"), ElementsAre(L"stop signaled"));
}

TEST_F(ManagerTest, ATriggerThatIsListedTwiceMakesTwoPairs) {
  m_scripts[L"c"] = {60};
  const auto manager = Manager(Document(Counter("c", R"("t","t")"), TriggerText("t", 2, ">=")));
  ASSERT_TRUE(manager->Init());
  EXPECT_TRUE(manager->Start());
  const std::vector<std::wstring> lines = LinesOf(L"Tick");
  EXPECT_EQ(std::count(lines.begin(), lines.end(), L"[c,t] UPDATE; cnt = 1; value = 60.000000"), 2);
  EXPECT_EQ(std::count(lines.begin(), lines.end(), L"[c,t] UPDATE; cnt = 2; value = 60.000000"), 2);
  EXPECT_EQ(std::count(lines.begin(), lines.end(), L"[c,t] TRIGGER"), 2);
}

TEST_F(ManagerTest, AFailedFirstCollectionIsLoggedAsZero) {
  m_scripts[L"c"] = {std::nullopt, 60};
  const auto manager = Manager(Document(Counter("c", R"("t")", R"(, "saveToFile":true)"), TriggerText("t", 1, ">")));
  ASSERT_TRUE(manager->Init());
  EXPECT_TRUE(manager->Start());
  EXPECT_THAT(LinesOf(L"Tick"), ElementsAre(L"[c,t] UPDATE; cnt = 1; value = 0.000000", L"[c,t] TRIGGER"));
  EXPECT_FALSE(PathExists(m_folder.Path(L"c.csv"))) << "what could not be read is no sample";
}

TEST_F(ManagerTest, ATriggerAfterNothingFiresOnTheFirstTickWhateverTheReading) {
  const auto manager = Manager(Document(Counter("unknown counter", R"("t")"), TriggerText("t", 0, "")));
  ASSERT_TRUE(manager->Init());
  EXPECT_TRUE(manager->Start());
  EXPECT_THAT(LinesOf(L"Tick"), ElementsAre(L"[unknown counter,t] TRIGGER"));
}

TEST_F(ManagerTest, SamplesAreSavedBesideTheConfigurationUnderASafeName) {
  m_scripts[L"a/b"] = {1, 40, 2.5, 60};
  const auto manager = Manager(Document(Counter("a/b", R"("t")", R"(, "saveToFile":true)"), TriggerText("t", 1, ">")));
  ASSERT_TRUE(manager->Init());
  EXPECT_TRUE(manager->Start());
  WIN32_FIND_DATAW found;
  const FindHandle search(FindFirstFileW(m_folder.Path(L"a_b-*.csv").c_str(), &found));
  ASSERT_TRUE(search);
  const std::vector<std::string> lines = Lines(LogText(m_folder.Path(found.cFileName)));
  EXPECT_THAT(lines, ElementsAre("time,value", EndsWith("Z,1"), EndsWith("Z,2.5")));
}

TEST_F(ManagerTest, WithoutAPairOnlyStopEndsTheRun) {
  for (const char* configuration : {"{}", "this is no JSON"}) {
    const auto manager = Manager(configuration);
    ASSERT_TRUE(manager->Init());
    std::atomic<bool> isOver{false};
    std::thread runner([&] {
      EXPECT_TRUE(manager->Start());
      isOver = true;
    });
    Sleep(100);
    EXPECT_FALSE(isOver);
    manager->Stop();
    runner.join();
  }
  EXPECT_THAT(LinesOf(L"LoadConfigurationFromFile"),
              ElementsAre(L"No performance counters specified", L"No triggers specified", L"No triggers specified",
                          HasSubstr(L"Invalid json format for configuration file "), HasSubstr(L"Syntax error"),
                          L"No performance counters specified", L"No triggers specified", L"No triggers specified"));
  EXPECT_THAT(LinesOf(L"Start"), ElementsAre(L"stop signaled", L"stop signaled"));
}

TEST_F(ManagerTest, PairsThatTheQueueRefusesDoNotKeepTheRunFromEnding) {
  m_scripts[L"c"] = {60};
  std::string never = Counter("never", R"("t","t")");
  never.replace(never.find(":5"), 2, ":0");
  for (const std::string& counters : {never + "," + Counter("c", R"("t")"), never}) {
    const auto manager = Manager(Document(counters, TriggerText("t", 1, ">")));
    ASSERT_TRUE(manager->Init());
    EXPECT_TRUE(manager->Start());
  }
  EXPECT_THAT(LinesOf(L"Start"),
              ElementsAre(L"[never,t] is not watched", L"[never,t] is not watched", L"stop signaled",
                          L"[never,t] is not watched", L"[never,t] is not watched", L"stop signaled"));
}

TEST_F(ManagerTest, StopWhileAnActionRunsFinishesItsDumpAndBeginsNothingElse) {
  m_scripts[L"c"] = {60};
  const KernelHandle begun(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  std::atomic<int> dumps{0};
  std::atomic<bool> stopped{false};
  m_writer = [&](HANDLE, DWORD, HANDLE file) -> DWORD {
    ++dumps;
    SetEvent(begun.Get());
    while (!stopped)
      Sleep(1);
    Sleep(50);  // Start is waiting for us now
    std::string dump("MDMP\x93\xA7\0\0\1\0\0\0\x20\0\0\0", 16);
    dump.resize(200);
    DWORD written = 0;
    return WriteFile(file, dump.data(), 200, &written, nullptr) ? ERROR_SUCCESS : GetLastError();
  };
  const std::string action =
      R"({"id":"a", "type":"dump", "parameters":{"pid":)" + std::to_string(GetCurrentProcessId()) + "}}";
  const auto manager =
      Manager(Document(Counter("c", R"("t","never")"),
                       TriggerText("t", 1, ">", R"("a","a","a")") + "," + TriggerText("never", 1, ""), action));
  ASSERT_TRUE(manager->Init());
  std::thread stopper([&] {
    WaitForSingleObject(begun.Get(), INFINITE);
    manager->Stop();
    stopped = true;
  });
  EXPECT_TRUE(manager->Start());
  stopper.join();
  EXPECT_EQ(dumps, 1);
  const std::wstring dump =
      std::wstring(LastPathComponent(ProgramPath())) + L"_" + std::to_wstring(GetCurrentProcessId()) + L".dmp";
  EXPECT_EQ(LogText(m_folder.Path(dump)).size(), 200U);
  EXPECT_THAT(LinesOf(L"Start"), ElementsAre(L"stop signaled"));
}

TEST_F(ManagerTest, ThousandsOfCountersAndHugeIdsAreNoTrouble) {
  std::string counters = Counter("", R"("t")") + "," + Counter(std::string(100'000, 'x'), R"("t")");
  for (int i = 0; i < 10'000; ++i)
    counters += "," + Counter("counter " + std::to_string(i), R"("t")");
  const auto manager = Manager(Document(counters, TriggerText("t", 0, "")));
  ASSERT_TRUE(manager->Init());
  const ULONGLONG begin = GetTickCount64();
  EXPECT_TRUE(manager->Start());
  EXPECT_LT(GetTickCount64() - begin, 60'000U);
}

TEST_F(ManagerTest, WhatCannotBeUsedIsRefusedByInitWithAReason) {
  const std::wstring real = m_framework;
  struct {
    std::string configuration;
    std::wstring framework;
    std::vector<const wchar_t*> lines;  // at error level, ends of them, in order
  } const rows[] = {
      {Document(Counter("c", R"("t","u")"), TriggerText("t", 1, ">")),
       real,
       {L"PdhAddCounter -1073738823", L"Not a valid configuration"}},
      {Document("", TriggerText("t", 1, ">", R"("a")")), real, {L"Not a valid configuration"}},
      {Document(Counter("c", R"("t")"), TriggerText("t", 1, ">") + "," + TriggerText("t", 2, ">")),
       m_folder.Path(L"framework.dll"),
       {L"PdhAddCounter -1073738823", L"section triggers is cut short by a bad element", L"framework.dll: 126",
        L"Failed to init EQ : 126"}},
      {R"({"limits":{"maxDumps":"3"}})", real, {L"is not a whole number from 0 on", L"Not a valid configuration"}},
      {R"({"performanceCounters":[], "triggers":[], "actions":[]})",
       ProgramFolder() + L"\\log_partial.dll",
       {L"does not export QxCreateObject", L"Failed to init EQ : 127"}},
  };
  for (const auto& row : rows) {
    logging::ErrorCapture errors;
    m_framework = row.framework;
    EXPECT_FALSE(Manager(row.configuration)->Init()) << row.configuration;
    std::vector<testing::Matcher<std::wstring>> ends;
    for (const wchar_t* line : row.lines)
      ends.emplace_back(EndsWith(line));
    EXPECT_THAT(errors.Take(), testing::ElementsAreArray(ends)) << row.configuration;
  }
  EXPECT_THAT(LinesOf(L"IsValidConfiguration"),
              ElementsAre(L"trigger with name u was not found", L"action with name a was not found"));

  logging::ErrorCapture errors;
  EXPECT_FALSE(MonitoringManager(m_folder.Path(L"absent.json")).Init());
  EXPECT_FALSE(MonitoringManager(m_folder.Path()).Init()) << "a folder";
  EXPECT_THAT(errors.Take(), ElementsAre(HasSubstr(L"Invalid path for configuration file "),
                                         HasSubstr(L"cannot read configuration file ")));
}

}  // namespace
}  // namespace st::monitoring
