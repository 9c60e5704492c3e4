// The monitoring mode: reads the configuration, samples each counter for each of its triggers on the event queue, and
// runs the actions of the triggers that fire.
#pragma once

#include <windows.h>

#include <atomic>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "core/scoped.h"
#include "monitoring/action.h"
#include "monitoring/configuration.h"
#include "monitoring/dump_budget.h"
#include "monitoring/easy_eq.h"
#include "monitoring/performance_counter.h"
#include "monitoring/sample_file.h"
#include "monitoring/trigger.h"

namespace st::monitoring {

// What a run stands on; tests put something else in its place.
struct Surroundings {
  CounterQueryMaker makeQuery;
  MiniDumpWriter writeDump;
  std::wstring frameworkLibrary;  // full path
};

Surroundings ProgramSurroundings();  // the system's counters and dumps, "framework.dll" in the program's folder

// Init, then Start, each once and on one thread; Stop from any thread between them or later.
class MonitoringManager {
 public:
  explicit MonitoringManager(std::wstring configurationPath, Surroundings surroundings = ProgramSurroundings());
  ~MonitoringManager();
  MonitoringManager(const MonitoringManager&) = delete;
  MonitoringManager& operator=(const MonitoringManager&) = delete;

  // False, and logged, when there is no configuration that can be used or no event queue.
  bool Init();

  // Blocks until every pair of a counter and a trigger has fired and run its actions, or until Stop. Without any pair
  // only Stop ends it. When it returns, nothing runs any more.
  bool Start();

  // Makes Start return. A dump that is being written is finished; nothing further is begun.
  void Stop();

 private:
  class PairItem;
  // One counter with one of its triggers.
  struct Pair {
    EventQueueHandle handle = 0;          // 0: not scheduled
    std::atomic<uint8_t> isCancelled{0};  // fired; set once
    int32_t count = 0;                    // matches; only its own work item touches it
  };

  bool LoadConfigurationFromFile(const std::wstring& path);
  bool LoadConfiguration(std::string_view bytes, const std::wstring& path);
  bool LoadPerformanceCounters(const Json::Value& array);
  bool LoadTriggers(const Json::Value& array);
  bool LoadActions(const Json::Value& array);
  bool IsValidConfiguration() const;
  void MakeSampleFiles(uint64_t mostBytes);

  void SchedulePairs();
  void Tick(Pair& pair, PerformanceCounter& counter, const Trigger& trigger);
  double ReadForLog(PerformanceCounter& counter);
  void Fire(Pair& pair, const Trigger& trigger);
  void EndPair();

  ById<PerformanceCounter> m_counters;
  ById<Trigger> m_triggers;
  ById<Action> m_actions;
  const std::wstring m_configurationPath;
  EasyEQ m_queue;
  std::vector<Pair> m_pairs;  // not resized once work items refer to them
  std::atomic<int64_t> m_activePairs{0};
  KernelHandle m_stopEvent;  // auto-reset

  const Surroundings m_surroundings;
  std::atomic<bool> m_isStopping{false};
  std::unique_ptr<DumpBudget> m_budget;                               // the actions refer to it
  std::map<std::wstring, std::unique_ptr<SampleFile>> m_sampleFiles;  // by counter id
};

}  // namespace st::monitoring
