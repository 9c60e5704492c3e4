#include "systeminfo/process_dump_collector.h"

#include <algorithm>
#include <utility>

#include "core/files.h"
#include "core/format.h"
#include "core/logging.h"
#include "core/own_files.h"
#include "core/paths.h"
#include "core/text.h"
#include "systeminfo/collecting_settings.h"
#include "systeminfo/utils/mini_dump.h"

namespace systeminfo {
namespace {

constexpr wchar_t kStart[] = L"systeminfo::ProcessDumpCollector::Start";
constexpr wchar_t kDumpProcess[] = L"systeminfo::ProcessDumpCollector::DumpProcess";

void LogNotCreated(const std::wstring& path, DWORD error) {
  LOG_ERROR(kDumpProcess, L"Could not create file %s for dump", path.c_str());
  LOG_ERROR(kDumpProcess, L"error %u", error);
}

// The dump under its temporary name. False when the file was not created, or is not whole.
bool WritePartialDump(HANDLE process, uint32_t processId, const std::wstring& path) {
  const std::wstring partial = ExtendedPath(path) + kPartialSuffix;
  const KernelHandle file = CreateFreshFile(partial.c_str(), GENERIC_READ | GENERIC_WRITE, 0);
  if (!file) {
    LogNotCreated(path, GetLastError());
    return false;
  }
  DWORD error = ::utils::WriteMiniDump(process, processId, file.Get(), &MyMiniDumpCallback);
  if (error == ERROR_SUCCESS && !FlushFileBuffers(file.Get())) error = GetLastError();
  if (error != ERROR_SUCCESS) LOG_ERROR(kDumpProcess, L"MiniDumpWriteDump fails with code %d", error);
  return error == ERROR_SUCCESS;
}

}  // namespace

ProcessDumpCollector::ProcessDumpCollector(std::wstring name) : ICollector(std::move(name)) {
  m_processes.TakeProceessesSnapshot();
}

void ProcessDumpCollector::Start(const std::shared_ptr<CollectingSettings>& settings,
                                 const std::shared_ptr<WMIWrapper>&, const std::atomic<bool>* cancel) {
  const Json::Value targets = settings->GetValue(m_name);
  if (targets.isNull()) {
    LOG_TRACE(kStart, L"no processes to dump were configured");
    return;
  }
  if (!targets.isArray()) {
    LOG_ERROR(kStart, L"Expecting a json array of objects");
    return;
  }
  settings->GetOutputFolderValue(m_folder);
  for (const Json::Value& target : targets) {
    if (IsCancelled(cancel)) return;
    if (target.isObject()) {
      DumpTarget(target, cancel);
    } else {
      LOG_ERROR(kStart, L"Expecting a json array of objects");
    }
  }
}

void ProcessDumpCollector::DumpTarget(const Json::Value& target, const std::atomic<bool>* cancel) const {
  const Json::Value& name = target["name"];
  if (name.isArray() || name.isObject()) {
    LOG_ERROR(kStart, L"need text value for a name");
  } else if (!name.isNull()) {
    const std::wstring text = ToWide(name.asString());
    for (const auto& [processId, process] : m_processes.GetProcessesByName(text)) {
      if (IsCancelled(cancel)) return;
      DumpProcess(text, process, processId);
    }
  } else if (const std::optional<uint32_t> processId = DumpTargetId(target["pid"])) {
    DumpProcess(*processId);
  } else {
    LOG_ERROR(kStart, L"need numeric value");
  }
}

void ProcessDumpCollector::DumpProcess(uint32_t processId) const {
  const std::wstring path = m_processes.GetProcessDataByPid(processId);
  const std::wstring name = path.substr(path.find_last_of(L'\\') + 1);
  LOG_TRACE(kDumpProcess, L"strippedName %s", name.c_str());
  const std::vector<ProcessRecord>& records = m_processes.Records();
  const auto record = std::find_if(records.begin(), records.end(),
                                   [processId](const ProcessRecord& r) { return r.processId == processId; });
  if (record != records.end()) DumpProcess(name, record->process.Get(), processId);
}

void ProcessDumpCollector::DumpProcess(const std::wstring& name, HANDLE process, uint32_t processId) const {
  LOG_TRACE(kDumpProcess, L"name %s handle %x pid %u", name.c_str(), HandleToULong(process), processId);
  if (process == nullptr) {
    LOG_ERROR(kDumpProcess, L"the process %u could not be opened for a dump", processId);
    return;
  }
  const std::wstring fileName = ::utils::DumpFileName(name, processId);
  LOG_TRACE(kDumpProcess, L"dump name %s", fileName.c_str());
  const std::wstring path(JoinPath(m_folder, fileName));
  if (!WritePartialDump(process, processId, path)) return;
  if (const DWORD error = PublishPartialFile(path); error != ERROR_SUCCESS) LogNotCreated(path, error);
}

std::optional<uint32_t> DumpTargetId(const Json::Value& value) {
  if (!value.isNumeric() && !value.isBool()) return std::nullopt;
  const double number = value.asDouble();  // holds every id exactly
  constexpr double kOneTooMany = 4294967296.0;
  if (!(number > -1 && number < kOneTooMany)) return std::nullopt;
  return static_cast<uint32_t>(number);
}

BOOL CALLBACK MyMiniDumpCallback(void*, PMINIDUMP_CALLBACK_INPUT input, PMINIDUMP_CALLBACK_OUTPUT output) {
  return ::utils::FilterMiniDump({L"systeminfo::MyMiniDumpCallback", logging::Level::kInfo}, input, output);
}

}  // namespace systeminfo
