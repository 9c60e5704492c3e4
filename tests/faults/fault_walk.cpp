// Runs one scenario again and again, failing another call of it each time, and looks at what each run leaves.
// usage: fault_walk SCENARIO [most=N] [errors=all] [from=K] [only=NAME[:CALL[:ERROR]]]
//   most    how many of the calls of one function are failed: the first, the last, and others spread between; 0: all
//   errors  every error of the table, not only a call's first one
//   from    begins with the K-th run of the plan, to go on behind one that did not end
//   only    one function, one call of it, one error
// fault_walk list   names the scenarios
// Prints "plan RUNS functions=F calls=C", "run K NAME:CALL:ERROR", "bad K WHAT" and at the end "walked RUNS struck=S".
// Ends with 1 when something was bad, 2 when the scenario does not work by itself, 3 when a run took too long.
#include <windows.h>

#include <objbase.h>

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <optional>
#include <thread>

#include "core/delete_folder.h"
#include "core/dynamic_library.h"
#include "core/files.h"
#include "core/format.h"
#include "core/logger_config.h"
#include "core/logging.h"
#include "core/program_path.h"
#include "core/text.h"
#include "tests/faults/fault_layer.h"
#include "tests/faults/run_checks.h"
#include "tests/faults/scenarios.h"

namespace faults {
namespace {

constexpr ULONGLONG kLongestRun = 30'000;  // milliseconds
constexpr int kExitBad = 1;
constexpr int kExitUnfit = 2;
constexpr int kExitHangs = 3;

struct Options {
  uint32_t most = 3;
  bool allErrors = false;
  size_t from = 0;
  std::string onlyName;
  uint32_t onlyCall = 0;
  std::optional<uint32_t> onlyError;
};

Options ReadOptions(int count, wchar_t** arguments) {
  Options options;
  for (int i = 2; i < count; ++i) {
    const std::string text = ToUtf8(arguments[i]);
    const auto value = [&text](std::string_view name) -> std::optional<std::string> {
      return text.starts_with(name) ? std::optional(text.substr(name.size())) : std::nullopt;
    };
    if (const auto most = value("most=")) options.most = static_cast<uint32_t>(std::stoul(*most));
    if (const auto from = value("from=")) options.from = std::stoul(*from);
    if (value("errors=all")) options.allErrors = true;
    if (auto only = value("only=")) {
      std::replace(only->begin(), only->end(), ':', ' ');
      const size_t call = std::min(only->find(' '), only->size());
      const size_t error = std::min(only->find(' ', call + 1), only->size());
      options.onlyName = only->substr(0, call);
      if (call < only->size()) options.onlyCall = static_cast<uint32_t>(std::stoul(only->substr(call)));
      if (error < only->size()) options.onlyError = static_cast<uint32_t>(std::stoul(only->substr(error), nullptr, 0));
    }
  }
  return options;
}

// Failures that change nothing, and that nobody is told of on purpose. The run has to end as if nothing had failed.
struct Harmless {
  size_t row;
  const char* scenario;  // empty: any
  const char* why;
};
constexpr Harmless kHarmless[] = {
    {row::GetCurrentDirectoryW_, "", "a relative path goes to the system as it is"},
    {row::GetFileAttributesW_, "", "what is taken for absent is made, or opened, and that tells"},
    {row::GetFirmwareEnvironmentVariableW_, "", "fails anyway; what is reported rests on that"},
    {row::BCryptCreateHash_, "", "a hash that begins behind the last one is never used"},
    {row::GetModuleFileNameW_, "", "a run-time library does not find the logging library; nobody is left to tell"},
    {row::IWbemClassObject_Get_, "running_tasks", "a property that its class does not deny is asked for"},
    {row::GetProcAddress_, "running_tasks", "the fixed trace line names the step, without a number"},
    {row::LoadLibraryExW_, "running_tasks", "the same"},
    {row::NtQueryObject_, "running_tasks", "the same"},
    {row::PdhCollectQueryData_, "monitoring", "a sample that was not taken is no sample"},
    {row::timeBeginPeriod_, "monitoring", "the timers are as coarse as the system's"},
    {row::LoadLibraryExW_, "monitoring", "is tried once more, with the search in the library's own folder"},
};

bool IsHarmless(size_t row, std::string_view scenario) {
  return std::any_of(std::begin(kHarmless), std::end(kHarmless), [=](const Harmless& harmless) {
    return harmless.row == row && (*harmless.scenario == '\0' || harmless.scenario == scenario);
  });
}

// Which of `count` calls are failed: all, or `most` of them spread evenly with the first and the last.
std::vector<uint32_t> ChosenCalls(uint32_t count, uint32_t most) {
  std::vector<uint32_t> calls;
  if (most == 0 || count <= most) {
    for (uint32_t call = 1; call <= count; ++call)
      calls.push_back(call);
    return calls;
  }
  for (uint32_t i = 0; i < most; ++i)
    calls.push_back(1 + static_cast<uint32_t>(uint64_t{i} * (count - 1) / std::max(most - 1, 1U)));
  return calls;
}

std::vector<Fault> MakePlan(const std::vector<uint32_t>& counts, const Options& options) {
  std::vector<Fault> plan;
  for (size_t row = 0; row < kCallCount; ++row) {
    if (!options.onlyName.empty() && options.onlyName != kCalls[row].name) continue;
    const auto calls =
        options.onlyCall == 0 ? ChosenCalls(counts[row], options.most) : std::vector<uint32_t>{options.onlyCall};
    auto errors = options.allErrors ? kCalls[row].errors : kCalls[row].errors.first(1);
    if (options.onlyError) errors = std::span(&*options.onlyError, 1);
    for (const uint32_t call : calls) {
      for (const uint32_t error : errors)
        plan.push_back({row, call, error});
    }
  }
  return plan;
}

// Ends the process when a run takes too long: nobody could end the run.
class Watchdog {
 public:
  Watchdog() : m_thread([this] { Watch(); }) { m_thread.detach(); }

  void Begin() { m_deadline = GetTickCount64() + kLongestRun; }
  void End() { m_deadline = 0; }

 private:
  void Watch() const {
    for (;;) {
      Sleep(100);
      const ULONGLONG deadline = m_deadline;
      if (deadline != 0 && GetTickCount64() > deadline) TerminateProcess(GetCurrentProcess(), kExitHangs);
    }
  }

  std::atomic<ULONGLONG> m_deadline{0};
  std::thread m_thread;
};

class Walk {
 public:
  explicit Walk(Scenario scenario)
      : m_scenario(std::move(scenario)), m_folder(CurrentFolder()), m_log(m_folder + L"\\logs\\") {}

  // Runs without a fault, to know what is ordinary. False when that does not work.
  bool Prepare(std::vector<uint32_t>& counts) {
    constexpr int kOrdinaryRuns = 3;  // the first one loads and caches much
    counts.resize(kCallCount);
    for (int i = 0; i < kOrdinaryRuns; ++i) {
      const int result = Run(Fault());
      for (size_t row = 0; row < kCallCount; ++row)
        counts[row] = CountOfCalls(row);
      for (const std::string& record : m_log.NewRecords()) {
        m_ordinary.insert(WithoutDigits(record));
        m_ordinaryLetters.insert(record);
      }
      if (result != m_scenario.good) {
        std::printf("bad 0 without a fault the result is %d\n", result);
        return false;
      }
    }
    return true;
  }

  // What is bad about a run with this fault.
  std::vector<std::string> Try(const Fault& fault) {
    const int result = Run(fault);
    std::vector<std::string> bad = m_fileProblems;
    if (std::count(m_scenario.documented.begin(), m_scenario.documented.end(), result) == 0) {
      bad.push_back("result " + std::to_string(result));
    }
    const std::vector<std::string> records = m_log.NewRecords();
    const bool isUnseen = result == m_scenario.good && IsHarmless(fault.row, m_scenario.name);
    if (FaultHasStruck() && !isUnseen && !IsTold(records, fault)) {
      bad.emplace_back("not told; result " + std::to_string(result));
      for (const std::string& record : records) {
        if (IsGrave(record) && m_ordinary.count(WithoutDigits(record)) == 0)
          bad.push_back("  said: " + record.substr(0, 300));
      }
    }
    if (FaultHasStruck() && Leaks(fault)) bad.emplace_back("handles stay open");
    return bad;
  }

 private:
  static bool IsGrave(const std::string& record) { return !record.starts_with("TRACE") && !record.starts_with("INFO"); }

  static std::wstring CurrentFolder() {
    std::wstring folder(GetCurrentDirectoryW(0, nullptr), L'\0');
    folder.resize(GetCurrentDirectoryW(static_cast<DWORD>(folder.size()), folder.data()));
    return folder;
  }

  int Run(const Fault& fault) {
    m_scenario.prepare();
    const std::set<std::wstring> before = FilesBelow(m_folder);
    m_handlesBefore = CountHandles();
    m_watchdog.Begin();
    BeginFaults(&fault);
    const int result = m_scenario.run();
    EndFaults();
    m_watchdog.End();
    m_handlesAfter = HandlesWhenSettled();
    LookAtFiles(before);
    Clear();
    return result;
  }

  // Threads that end by themselves need a moment.
  size_t HandlesWhenSettled() const {
    size_t count = CountHandles();
    for (int i = 0; i < 20 && count > m_handlesBefore; ++i) {
      Sleep(10);
      count = CountHandles();
    }
    return count;
  }

  void LookAtFiles(const std::set<std::wstring>& before) {
    m_fileProblems.clear();
    for (const std::wstring& file : FilesBelow(m_folder)) {
      if (before.count(file) != 0 || file.starts_with(L"\\logs")) continue;
      const std::string name = ToUtf8(file);
      if (file.starts_with(L"\\temp")) m_fileProblems.push_back("left in the temporary folder: " + name);
      const std::string problem = FileProblem(m_folder + file);
      if (!problem.empty()) m_fileProblems.push_back(std::string(name).append(": ").append(problem));
    }
    for (const std::wstring& file : before) {
      if (file.starts_with(L"\\temp") && !PathExists(m_folder + file)) {
        m_fileProblems.push_back("gone from the temporary folder: " + ToUtf8(file));
      }
    }
  }

  void Clear() const {
    for (const std::wstring& file : FilesBelow(m_folder)) {
      if (file.ends_with(kPartialSuffix)) DeleteFileW((m_folder + file).c_str());
    }
    std::wstring names = ToWide(m_scenario.clears);
    while (!names.empty()) {
      const size_t end = std::min(names.find(L' '), names.size());
      const std::wstring path = m_folder + L"\\" + names.substr(0, end);
      if (FolderExists(path)) {
        DeleteFolder(path, true);
      } else {
        DeleteFileW(path.c_str());
      }
      names.erase(0, end + 1);
    }
  }

  bool IsTold(const std::vector<std::string>& records, const Fault& fault) const {
    return std::any_of(records.begin(), records.end(), [&](const std::string& record) {
      const bool isNewKind = m_ordinary.count(WithoutDigits(record)) == 0;
      constexpr uint32_t kLeastTelling = 100;  // smaller numbers are in many a record
      const bool isNew = isNewKind || (fault.error >= kLeastTelling && m_ordinaryLetters.count(record) == 0);
      return (isNew && TellsError(record, kCalls[fault.row].failsAs, fault.error)) || (isNewKind && IsGrave(record));
    });
  }

  // What is loaded once and kept is no leak: only what grows with every run.
  bool Leaks(const Fault& fault) {
    for (int i = 0; i < 3; ++i) {
      if (m_handlesAfter <= m_handlesBefore) return false;
      Run(fault);
      m_log.NewRecords();
    }
    return m_handlesAfter > m_handlesBefore;
  }

  const Scenario m_scenario;
  const std::wstring m_folder;
  LogReader m_log;
  Watchdog m_watchdog;
  std::set<std::string> m_ordinary;         // records of runs without a fault, WithoutDigits
  std::set<std::string> m_ordinaryLetters;  // the same with them
  std::vector<std::string> m_fileProblems;
  size_t m_handlesBefore = 0;
  size_t m_handlesAfter = 0;
};

std::string Name(const Fault& fault) {
  return kCalls[fault.row].name + std::string(":") + std::to_string(fault.call) + ":" + std::to_string(fault.error);
}

// What every run would start anew, at the cost of handles that the system or the run-time library of the compiler keeps
// until the process ends: COM, and libraries whose code has thread-local data.
class Kept {
 public:
  Kept() { CoInitializeEx(nullptr, COINIT_MULTITHREADED); }

 private:
  const DynamicLibrary m_upload{(ProgramFolder() + L"\\qxlink.dll").c_str()};
  const DynamicLibrary m_events{(ProgramFolder() + L"\\framework.dll").c_str()};
};

int WalkAll(const Scenario& scenario, const Options& options) {
  Walk walk(scenario);
  std::vector<uint32_t> counts;
  if (!walk.Prepare(counts)) return kExitUnfit;
  const std::vector<Fault> plan = MakePlan(counts, options);
  uint64_t calls = 0;
  for (const uint32_t count : counts)
    calls += count;
  std::printf("plan %zu functions=%td calls=%llu\n", plan.size(),
              std::count_if(counts.begin(), counts.end(), [](uint32_t count) { return count != 0; }),
              static_cast<unsigned long long>(calls));
  size_t struck = 0;
  bool isGood = true;
  for (size_t i = options.from; i < plan.size(); ++i) {
    std::printf("run %zu %s\n", i, Name(plan[i]).c_str());
    std::fflush(stdout);
    const std::vector<std::string> bad = walk.Try(plan[i]);
    if (FaultHasStruck()) ++struck;
    for (const std::string& what : bad)
      std::printf("bad %zu %s\n", i, what.c_str());
    isGood = isGood && bad.empty();
  }
  std::printf("walked %zu struck=%zu\n", plan.size() - std::min(options.from, plan.size()), struck);
  return isGood ? 0 : kExitBad;
}

}  // namespace
}  // namespace faults

int wmain(int count, wchar_t** arguments) {
  using namespace faults;
  if (count < 2) return kExitUnfit;
  const std::string name = ToUtf8(arguments[1]);
  SetEnvironmentVariableW(L"TMP", ExtendedPath(L"temp").substr(4).c_str());
  RestrictLibrarySearch();
  const auto log = logging::CLogDLL::Get();
  logging::LoggerConfig::Init();
  const Kept kept;
  for (const Scenario& scenario : AllScenarios()) {
    if (name == "list") std::printf("%s\n", scenario.name.c_str());
    if (name == scenario.name) return WalkAll(scenario, ReadOptions(count, arguments));
  }
  return name == "list" ? 0 : kExitUnfit;
}
