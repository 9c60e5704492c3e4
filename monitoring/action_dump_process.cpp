#include "monitoring/action_dump_process.h"

#include <optional>
#include <utility>

#include "core/files.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/scope_exit.h"
#include "monitoring/dump_rules.h"
#include "systeminfo/utils/mini_dump.h"

namespace st::monitoring {
namespace {

constexpr wchar_t kRun[] = L"st::monitoring::ActionDumpProcess::Run";
constexpr wchar_t kDump[] = L"st::monitoring::ActionDumpProcess::DumpProcess";

std::optional<uint64_t> FreeDiskBytes() {
  ULARGE_INTEGER bytes{};
  if (GetDiskFreeSpaceExW(nullptr, &bytes, nullptr, nullptr)) return bytes.QuadPart;  // of the current directory's disk
  LOG_WARNING(kDump, L"GetDiskFreeSpaceEx failed with error code : %d", GetLastError());
  return std::nullopt;
}

bool HasEnded(HANDLE process) {
  return WaitForSingleObject(process, 0) == WAIT_OBJECT_0;
}

std::string ReadBeginning(HANDLE file) {
  std::string bytes(kDumpBeginning, '\0');
  OVERLAPPED atStart{};
  DWORD count = 0;
  if (!ReadFile(file, bytes.data(), static_cast<DWORD>(bytes.size()), &count, &atStart)) count = 0;
  bytes.resize(count);
  return bytes;
}

}  // namespace

BOOL CALLBACK MyMiniDumpCallback(void*, PMINIDUMP_CALLBACK_INPUT input, PMINIDUMP_CALLBACK_OUTPUT output) {
  return utils::FilterMiniDump({L"st::monitoring::MyMiniDumpCallback", logging::Level::kInfo}, input, output);
}

DWORD WriteProcessDump(HANDLE process, DWORD processId, HANDLE file) {
  return utils::WriteMiniDump(process, processId, file, MyMiniDumpCallback);
}

ActionDumpProcess::ActionDumpProcess(ActionSettings settings, const ActionContext& context)
    : Action(std::move(settings)), m_context(context) {}

void ActionDumpProcess::Run() {
  const std::lock_guard lock(m_running);
  Action::Run();
  LOG_TRACE(kRun, L"params : %s", ParametersText().c_str());
  if (const std::optional<DumpTarget> target = ReadDumpTarget(Parameters(), LogNote)) {
    m_cache.TakeProceessesSnapshot();
    if (target->pid) {
      DumpByPid(*target->pid);
    } else {
      DumpByName(target->name);
    }
    m_cache = {};  // lets go of the processes
  }
  LOG_TRACE(kRun, L"action finished");
}

void ActionDumpProcess::DumpByPid(DWORD processId) {
  const ProcessRecord* const record = m_cache.GetProcessDataByPid(processId);
  if (record == nullptr) {
    LOG_ERROR(kRun, L"Could not find valid process data for pid %d", processId);
    return;
  }
  DumpProcess(record->handle.Get(), processId, std::wstring(LastPathComponent(record->name)));
  LOG_TRACE(kRun, L"Dump process completed for pid %d", processId);
}

void ActionDumpProcess::DumpByName(const std::wstring& name) {
  const std::vector<const ProcessRecord*> records = m_cache.GetProcessesByName(name);
  if (records.empty()) LOG_WARNING(kRun, L"no process has %s in its path", name.c_str());
  for (const ProcessRecord* record : records) {
    if (m_context.stop) {
      LOG_INFO(kRun, L"monitoring is being stopped; the remaining processes are not dumped");
      return;
    }
    DumpProcess(record->handle.Get(), record->id, name);
  }
}

void ActionDumpProcess::DumpProcess(HANDLE process, DWORD processId, const std::wstring& name) {
  LOG_TRACE(kDump, L"dumping process with pid %u", processId);
  const std::wstring path = ::utils::DumpFileName(name, processId);
  LOG_TRACE(kDump, L"dump name %s", path.c_str());
  if (HasEnded(process)) {
    LOG_ERROR(kDump, L"process %u has ended before its dump", processId);
    return;
  }
  if (const DumpBudget::Refusal refusal = m_context.budget.Begin(processId, FreeDiskBytes())) {
    LOG_ERROR(kDump, L"no dump of process %u: %s", processId, refusal->c_str());
    return;
  }
  uint64_t countedBytes = 0;
  ScopeExit giveBack([&] { m_context.budget.GiveBack(processId, countedBytes); });
  if (WriteDump(process, processId, path, countedBytes)) giveBack.Disarm();
}

// True when the dump stands under its name.
bool ActionDumpProcess::WriteDump(HANDLE process, DWORD processId, const std::wstring& path, uint64_t& countedBytes) {
  PartialFile file(path, FileRights::kPrivate);  // it holds another program's memory
  if (const DWORD error = file.Create(); error != ERROR_SUCCESS) {
    LOG_ERROR(kDump, L"Could not create file %s for dump", path.c_str());
    LOG_ERROR(kDump, L"CreateFile failed with error code : %d", error);
    return false;
  }
  if (const DWORD error = m_context.writeDump(process, processId, file.Handle()); error != ERROR_SUCCESS) {
    LOG_ERROR(kDump, L"MiniDumpWriteDump fails with code %d", error);
    return false;
  }
  LARGE_INTEGER size{};
  GetFileSizeEx(file.Handle(), &size);
  const auto bytes = static_cast<uint64_t>(size.QuadPart);
  if (!IsWholeDump(ReadBeginning(file.Handle()), bytes)) {
    LOG_ERROR(kDump, L"the dump of process %u is cut off after %I64u bytes and is not kept", processId, bytes);
    return false;
  }
  if (const DumpBudget::Refusal refusal = m_context.budget.Keep(bytes)) {
    LOG_ERROR(kDump, L"the dump of process %u is not kept: %s", processId, refusal->c_str());
    return false;
  }
  countedBytes = bytes;
  if (const DWORD error = file.Publish(); error != ERROR_SUCCESS) {
    LOG_ERROR(kDump, L"the dump %s cannot be given its name, error %d", path.c_str(), error);
    return false;
  }
  return true;
}

}  // namespace st::monitoring
