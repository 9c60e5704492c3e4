#include "monitoring/monitoring_manager.h"

#include <utility>

#include "core/files.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "core/safe_file_name.h"
#include "core/scope_exit.h"
#include "monitoring/action_dump_process.h"
#include "monitoring/trigger_rules.h"

namespace st::monitoring {
namespace {

constexpr wchar_t kSubscriber[] = L"st_monitoring";
constexpr wchar_t kInit[] = L"st::monitoring::MonitoringManager::Init";
constexpr wchar_t kStart[] = L"st::monitoring::MonitoringManager::Start";
constexpr wchar_t kTick[] = L"st::monitoring::MonitoringManager::Tick";

}  // namespace

// Carries a pair through the queue and keeps its counter and trigger alive.
class MonitoringManager::PairItem : public EqWorkItem {
 public:
  PairItem(MonitoringManager& manager, size_t index, std::shared_ptr<PerformanceCounter> counter,
           std::shared_ptr<Trigger> trigger)
      : m_manager(manager), m_index(index), m_counter(std::move(counter)), m_trigger(std::move(trigger)) {}

  void Run() override { m_manager.Tick(m_manager.m_pairs[m_index], *m_counter, *m_trigger); }

 private:
  MonitoringManager& m_manager;
  const size_t m_index;
  const std::shared_ptr<PerformanceCounter> m_counter;
  const std::shared_ptr<Trigger> m_trigger;
};

Surroundings ProgramSurroundings() {
  return {MakePdhQuery, WriteProcessDump, ProgramFolder() + L"\\framework.dll"};
}

MonitoringManager::MonitoringManager(std::wstring configurationPath, Surroundings surroundings)
    : m_configurationPath(std::move(configurationPath)), m_surroundings(std::move(surroundings)) {}

MonitoringManager::~MonitoringManager() {
  m_queue.Close();  // before anything that its work items use goes
}

bool MonitoringManager::Init() {
  if (!LoadConfigurationFromFile(m_configurationPath)) return false;
  if (const int32_t code = m_queue.Init(m_surroundings.frameworkLibrary); code != 0) {
    LOG_ERROR(kInit, L"Failed to init EQ : %d", code);
    return false;
  }
  m_stopEvent.Reset(CreateEventW(nullptr, FALSE, FALSE, nullptr));
  if (!m_stopEvent) LOG_ERROR(kInit, L"CreateEvent failed with error code : %d", GetLastError());
  return static_cast<bool>(m_stopEvent);
}

bool MonitoringManager::LoadConfigurationFromFile(const std::wstring& path) {
  if (!PathExists(path)) {
    LOG_ERROR(kLoadFunction, L"Invalid path for configuration file %s", path.c_str());
    return false;
  }
  std::string bytes;
  if (const DWORD error = ReadWholeFile(path, kLargestConfiguration, bytes); error != ERROR_SUCCESS) {
    LOG_ERROR(kLoadFunction, L"cannot read configuration file %s, error %d", path.c_str(), error);
    return false;
  }
  if (LoadConfiguration(bytes, path)) return true;
  LOG_ERROR(kLoadFunction, L"Not a valid configuration");
  return false;
}

bool MonitoringManager::LoadConfiguration(std::string_view bytes, const std::wstring& path) {
  const Json::Value document = ParseConfiguration(bytes, path, LogNote);
  Limits limits;
  if (!ReadLimits(document, limits, LogNote)) return false;
  m_budget = std::make_unique<DumpBudget>(limits);

  struct {
    const Section& section;
    bool (MonitoringManager::*load)(const Json::Value&);
  } const rows[] = {
      {kCounterSection, &MonitoringManager::LoadPerformanceCounters},
      {kTriggerSection, &MonitoringManager::LoadTriggers},
      {kActionSection, &MonitoringManager::LoadActions},
  };
  for (const auto& row : rows) {
    const Json::Value& section = document[row.section.member];
    if (section.isNull()) {
      LOG_ERROR(kLoadFunction, L"%s", row.section.absent);
    } else if (!(this->*row.load)(section)) {
      // The reason stands at trace level. What was loaded before it is used.
      LOG_ERROR(kLoadFunction, L"section %S is cut short by a bad element", row.section.member);
    }
  }
  MakeSampleFiles(limits.maxSampleFileBytes.value_or(kDefaultSampleFileBytes));
  return IsValidConfiguration();
}

bool MonitoringManager::LoadPerformanceCounters(const Json::Value& array) {
  const auto create = [this](const Json::Value& json) {
    return PerformanceCounter::Create(json, m_surroundings.makeQuery);
  };
  return LoadSection(array, kCounterSection, create, m_counters, LogNote);
}

bool MonitoringManager::LoadTriggers(const Json::Value& array) {
  return LoadSection(array, kTriggerSection, &Trigger::Create, m_triggers, LogNote);
}

bool MonitoringManager::LoadActions(const Json::Value& array) {
  const auto create = [this](const Json::Value& json) {
    return Action::Create(json, {*m_budget, m_isStopping, m_surroundings.writeDump});
  };
  return LoadSection(array, kActionSection, create, m_actions, LogNote);
}

bool MonitoringManager::IsValidConfiguration() const {
  constexpr wchar_t kFunction[] = L"st::monitoring::MonitoringManager::IsValidConfiguration";
  if (const auto* id = FindMissingReference(m_counters, &PerformanceCounter::TriggerIds, m_triggers)) {
    LOG_TRACE(kFunction, L"trigger with name %s was not found", id->c_str());
    return false;
  }
  if (const auto* id = FindMissingReference(m_triggers, &Trigger::ActionIds, m_actions)) {
    LOG_TRACE(kFunction, L"action with name %s was not found", id->c_str());
    return false;
  }
  return true;
}

void MonitoringManager::MakeSampleFiles(uint64_t mostBytes) {
  const std::wstring_view folder = ParentFolder(m_configurationPath);
  for (const auto& [id, counter] : m_counters) {
    if (!counter->SavesToFile()) continue;
    m_sampleFiles.emplace(
        id, std::make_unique<SampleFile>(std::wstring(JoinPath(folder, SafeFileName(id, L".csv"))), mostBytes));
  }
}

bool MonitoringManager::Start() {
  SchedulePairs();
  const DWORD result = WaitForSingleObject(m_stopEvent.Get(), INFINITE);
  if (result == WAIT_OBJECT_0) {
    LOG_TRACE(kStart, L"stop signaled");
  } else {
    LOG_TRACE(kStart, L"Error on wait occured : %d", result);
  }
  m_queue.Close();
  return result == WAIT_OBJECT_0;
}

void MonitoringManager::Stop() {
  m_isStopping = true;
  SetEvent(m_stopEvent.Get());
}

void MonitoringManager::SchedulePairs() {
  size_t count = 0;
  for (const auto& [id, counter] : m_counters)
    count += counter->TriggerIds().size();
  m_pairs = std::vector<Pair>(count);
  m_activePairs.exchange(static_cast<int64_t>(count));

  size_t index = 0;
  for (const auto& [id, counter] : m_counters) {
    for (const std::wstring& triggerId : counter->TriggerIds()) {
      auto item = std::make_unique<PairItem>(*this, index, counter, m_triggers.at(triggerId));
      const auto period = static_cast<int32_t>(counter->SampleInterval());
      // A pair that cannot run must not keep the others from ending.
      if (!m_queue.Schedule(kSubscriber, period, std::move(item), m_pairs[index].handle)) {
        LOG_ERROR(kStart, L"[%s,%s] is not watched", id.c_str(), triggerId.c_str());
        --m_activePairs;
        EndPair();
      }
      ++index;
    }
  }
}

void MonitoringManager::Tick(Pair& pair, PerformanceCounter& counter, const Trigger& trigger) {
  if (m_isStopping || pair.isCancelled != 0) return;  // a late tick
  // Two collections a tick, on purpose: the first is what the log tells, the second is what the trigger compares.
  const double value = ReadForLog(counter);
  const bool matched = trigger.Evaluate(counter);
  const bool fires = CountTick(matched, trigger.TriggerAfter(), pair.count);
  if (matched) {
    LOG_TRACE(kTick, L"[%s,%s] UPDATE; cnt = %d; value = %f", counter.Id().c_str(), trigger.Id().c_str(), pair.count,
              value);
  }
  if (!fires) return;
  LOG_TRACE(kTick, L"[%s,%s] TRIGGER", counter.Id().c_str(), trigger.Id().c_str());
  Fire(pair, trigger);
}

// 0 when the counter cannot be read. A value that was read goes into the counter's sample file, too.
double MonitoringManager::ReadForLog(PerformanceCounter& counter) {
  double value = 0;
  if (!counter.CollectQueryData() || !counter.GetCounterValue(value)) return 0;
  if (const auto file = m_sampleFiles.find(counter.Id()); file != m_sampleFiles.end()) {
    SYSTEMTIME now;
    GetSystemTime(&now);
    file->second->Append(now, value);
  }
  return value;
}

void MonitoringManager::Fire(Pair& pair, const Trigger& trigger) {
  if (pair.isCancelled.exchange(1) != 0) return;
  if (pair.handle != 0) m_queue.Cancel(pair.handle);
  --m_activePairs;
  const ScopeExit end([this] { EndPair(); });  // also when an action fails in a way that nobody thought of
  for (const std::wstring& actionId : trigger.ActionIds()) {
    if (m_isStopping) return;
    m_actions.at(actionId)->Run();
  }
}

void MonitoringManager::EndPair() {
  if (m_activePairs == 0) SetEvent(m_stopEvent.Get());
}

}  // namespace st::monitoring
