#include "systeminfo/data_collector.h"

#include <windows.h>

#include <algorithm>
#include <chrono>
#include <exception>
#include <utility>

#include "core/files.h"
#include "core/format.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/private_access.h"
#include "core/text.h"
#include "systeminfo/collector_table.h"
#include "systeminfo/settings_check.h"
#include "systeminfo/settings_document.h"

namespace systeminfo {
namespace {

constexpr wchar_t kBuildCollectors[] = L"systeminfo::DataCollectorImpl::BuildCollectors";
constexpr wchar_t kGetOutputFolder[] = L"systeminfo::DataCollectorImpl::GetOutputFolder";
constexpr wchar_t kCreateOutputFolder[] = L"systeminfo::DataCollectorImpl::CreateOutputFolder";
constexpr wchar_t kRunCollectors[] = L"systeminfo::DataCollectorImpl::RunCollectors";
constexpr wchar_t kWriteJsonFile[] = L"systeminfo::DataCollectorImpl::WriteJsonFile";
constexpr wchar_t kOutputFolderKey[] = L"output_folder";

void WarnOfUnknownKeys(const Json::Value& document) {
  std::vector<std::string> keys;
  for (const CollectorRow& row : CollectorTable())
    keys.push_back(ToUtf8(row.key));
  const std::vector<UnknownKey> unknown = FindUnknownKeys(document, keys);

  constexpr size_t kMostWarnings = 20;  // a file of something else altogether is full of them
  const size_t count = std::min(unknown.size(), kMostWarnings);
  for (size_t i = 0; i < count; ++i) {
    const std::wstring hint =
        unknown[i].nearest.empty() ? std::wstring() : L"; nearest is " + ToWide(unknown[i].nearest);
    LOG_WARNING(kBuildCollectors, L"The settings key %s names no collector%s", ToWide(unknown[i].key).c_str(),
                hint.c_str());
  }
  if (unknown.size() > count) {
    LOG_WARNING(kBuildCollectors, L"%u more settings keys name no collector",
                static_cast<unsigned>(unknown.size() - count));
  }
}

std::wstring QuotedNames(const CollectorList& collectors) {
  std::wstring names;
  for (const PlannedCollector& planned : collectors) {
    if (!names.empty()) names += L", ";
    names += L"'" + planned.collector->GetName() + L"'";
  }
  return names;
}

// The thread of a run; a new one takes the place of one that was left behind.
class RunThread {
 public:
  RunThread(std::shared_ptr<CollectingSettings> settings, WmiMaker connect, const TimeLimits& limits,
            const std::atomic<bool>* cancel)
      : m_settings(std::move(settings)), m_connect(std::move(connect)), m_limits(limits), m_cancel(cancel) {}

  // False when there is no WMI.
  bool Start() {
    m_thread.reset();
    m_thread = std::make_unique<CollectorThread>(m_settings, m_connect, m_limits, m_cancel);
    try {
      return m_thread->AwaitConnection();
    } catch (...) {
      m_thread.reset();
      throw;
    }
  }

  Ended Run(const std::shared_ptr<ICollector>& collector) {
    if (m_thread == nullptr || m_thread->IsAbandoned()) Replace();
    return m_thread->Run(collector);
  }

 private:
  // Most collectors have something to tell without WMI too.
  void Replace() {
    if (Start() || !m_thread->IsAbandoned()) return;
    LOG_ERROR(kRunCollectors, L"WMI does not answer any more; the run goes on without it");
    m_connect = [] { return nullptr; };
    Start();
  }

  const std::shared_ptr<CollectingSettings> m_settings;
  WmiMaker m_connect;
  const TimeLimits m_limits;
  const std::atomic<bool>* const m_cancel;
  std::unique_ptr<CollectorThread> m_thread;
};

// Everything about one run that does not change from collector to collector.
struct RunContext {
  RunThread thread;
  std::wstring outputFolder;
  bool pretty;
  std::chrono::milliseconds budget;
};

void WriteData(const Json::Value& data, const RunContext& context, CollectorOutcome& outcome) {
  outcome.records = CountRecords(data);
  const std::wstring path = std::wstring(JoinPath(context.outputFolder, outcome.name)) + L".json";
  const DWORD error = DataCollectorImpl::WriteJsonFile(path, data, context.pretty, outcome.bytes);
  outcome.outcome = error == ERROR_SUCCESS ? Outcome::kData : Outcome::kNotWritten;
  if (error != ERROR_SUCCESS) outcome.reason = Format(L"error %u", error);
}

void SetTimedOut(CollectorOutcome& outcome, const RunContext& context, Ending ending) {
  const bool isKept = outcome.outcome == Outcome::kData;
  outcome.outcome = Outcome::kTimedOut;
  outcome.reason = Format(L"it took longer than %g seconds", static_cast<double>(context.budget.count()) / 1000);
  if (isKept) outcome.reason += L"; what it had gathered is kept";
  if (ending == Ending::kAbandoned) outcome.reason += L", does not answer and was left behind";
  LOG_ERROR(kRunCollectors, L"The collector of %s timed out: %s", outcome.name.c_str(), outcome.reason.c_str());
}

void StartAndWrite(const std::shared_ptr<ICollector>& collector, RunContext& context, CollectorOutcome& outcome) {
  // A collector that finds nothing says so, or why, with its last line, of whatever level.
  logging::ErrorCapture lastLine(logging::Level::kTrace, logging::ErrorCapture::Keep::kLast);
  const Ended ended = context.thread.Run(collector);
  if (ended.failure) std::rethrow_exception(ended.failure);
  const bool hasData = ended.ending != Ending::kAbandoned && !collector->Data().isNull();
  if (hasData) {
    WriteData(collector->Data(), context, outcome);
  } else {
    const std::vector<std::wstring> said = lastLine.Take();
    outcome.reason = said.empty() ? L"nothing was found" : said.back();
    LOG_TRACE(kRunCollectors, L"No data collected for %s", outcome.name.c_str());
  }
  if (ended.ending != Ending::kInTime) SetTimedOut(outcome, context, ended.ending);
}

void SetFailed(CollectorOutcome& outcome, std::wstring reason) {
  outcome.outcome = Outcome::kFailed;
  outcome.reason = std::move(reason);
  outcome.records = 0;
  LOG_ERROR(kRunCollectors, L"The collector of %s failed: %s", outcome.name.c_str(), outcome.reason.c_str());
  LOG_TRACE(kRunCollectors, L"No data collected for %s", outcome.name.c_str());
}

// The boundary that no exception of a collector passes.
CollectorOutcome RunOne(const PlannedCollector& planned, RunContext& context) {
  CollectorOutcome outcome;
  outcome.name = planned.collector->GetName();
  outcome.className = planned.className;
  const auto start = std::chrono::steady_clock::now();
  try {
    StartAndWrite(planned.collector, context, outcome);
  } catch (const std::exception& exception) {
    SetFailed(outcome, ToWide(exception.what()));
  } catch (...) {
    SetFailed(outcome, L"an exception of unknown type");
  }
  const auto elapsed = std::chrono::steady_clock::now() - start;
  outcome.milliseconds = static_cast<uint64_t>(std::chrono::duration_cast<std::chrono::milliseconds>(elapsed).count());
  return outcome;
}

}  // namespace

DataCollectorImpl::DataCollectorImpl(std::shared_ptr<CollectingSettings> settings, WmiMaker connect,
                                     const TimeLimits& limits)
    : m_settings(std::move(settings)), m_connect(std::move(connect)), m_limits(limits) {}

int DataCollectorImpl::CollectAll(const std::atomic<bool>* cancel, const ProgressCallback& progress) {
  return RunCollectors(cancel, progress, BuildCollectors());
}

CollectorList DataCollectorImpl::BuildCollectors() const {
  WarnOfUnknownKeys(m_settings->Document());
  CollectorList collectors;
  for (const CollectorRow& row : CollectorTable()) {
    if (IsCollectorEnabled(row.key)) collectors.push_back({row.make(row.key), row.className});
  }
  return collectors;
}

bool DataCollectorImpl::IsCollectorEnabled(std::wstring_view key) const {
  return systeminfo::IsCollectorEnabled(m_settings->Document(), ToUtf8(key));
}

std::wstring DataCollectorImpl::GetOutputFolder() const {
  std::wstring folder;
  switch (m_settings->GetOutputFolderValue(folder)) {
    case OutputFolderStatus::kFound:
      break;
    case OutputFolderStatus::kAbsent:
      LOG_ERROR(kGetOutputFolder, L"%s not set", kOutputFolderKey);
      break;
    case OutputFolderStatus::kNotString:
      LOG_ERROR(kGetOutputFolder, L"%s does not have string type", kOutputFolderKey);
      break;
  }
  return folder;
}

bool DataCollectorImpl::CreateOutputFolder() const {
  const std::wstring folder = GetOutputFolder();
  if (folder.empty()) return false;
  if (PathExists(folder)) {
    LOG_ERROR(kCreateOutputFolder, L"%s already exists. doing nothing", kOutputFolderKey);
    return false;
  }
  DWORD error = CreatePrivateFolder(folder);
  // Somebody may have made the folder since the test above: as good as ourselves, if nobody else can reach into it.
  if (error == ERROR_ALREADY_EXISTS) error = MakeFolderPrivate(folder);
  if (error == ERROR_SUCCESS) return true;
  LOG_ERROR(kCreateOutputFolder, L"failed to create output folder %s", folder.c_str());
  LOG_ERROR(kCreateOutputFolder, L"error %u", error);
  return false;
}

int DataCollectorImpl::RunCollectors(const std::atomic<bool>* cancel, const ProgressCallback& progress,
                                     const CollectorList& collectors) {
  m_outcomes.clear();
  m_settings->Print();
  LOG_TRACE(kRunCollectors, L"Collecting data for : [%s]", QuotedNames(collectors).c_str());
  if (!CreateOutputFolder()) return kRunNoOutputFolder;
  m_limits.budget = m_settings->GetCollectorTimeout();
  RunContext context{RunThread(m_settings, m_connect, m_limits, cancel), GetOutputFolder(),
                     m_settings->GetPrettyPrint(), m_limits.budget};
  if (!context.thread.Start()) {
    LOG_ERROR(kRunCollectors, L"wmiwrapper init failed; will not continue");
    return kRunNoWmi;
  }

  logging::ErrorCapture errors;
  const int total = static_cast<int>(collectors.size());
  int current = 1;
  for (const PlannedCollector& planned : collectors) {
    if (IsCancelled(cancel)) {
      LOG_TRACE(kRunCollectors, L"cancel, early exit");
      return kRunCancelled;
    }
    LOG_TRACE(kRunCollectors, L"Collecting data for %s ...", planned.collector->GetName().c_str());
    CollectorOutcome& outcome = m_outcomes.emplace_back(RunOne(planned, context));
    outcome.errors = errors.Take();
    if (progress) progress(current, total);
    ++current;
  }
  return IsCancelled(cancel) ? kRunCancelled : kRunDone;
}

unsigned long DataCollectorImpl::WriteJsonFile(std::wstring_view path, const Json::Value& value, bool pretty,
                                               uint64_t& bytes) {
  PartialFile file(path);
  DWORD error = file.Create();
  uint64_t written = 0;
  const JsonSink sink = [&](std::string_view piece) {
    error = file.Write(piece);
    written += piece.size();
    return error == ERROR_SUCCESS;
  };
  if (error == ERROR_SUCCESS) pretty ? WriteStyledJson(value, sink) : WriteCompactJson(value, sink);
  if (error == ERROR_SUCCESS) error = file.Publish();
  if (error != ERROR_SUCCESS) {
    LOG_ERROR(kWriteJsonFile, L"Failed to write %s, error %u", std::wstring(path).c_str(), error);
  } else {
    bytes = written;
  }
  return error;
}

}  // namespace systeminfo
