// A stand-in for the system's pdh.dll where that has no counters of processes: "\Process(NAME)\% Processor Time" of the
// first running program NAME.exe, from the system's own process times. Lies beside the program under the name pdh.dll.
#include <windows.h>

#include <pdh.h>
#include <pdhmsg.h>
#include <tlhelp32.h>

#include <memory>
#include <string>

#include "core/scoped.h"

namespace {

constexpr std::wstring_view kBegin = L"\\Process(";
constexpr std::wstring_view kEnd = L")\\% Processor Time";
constexpr DWORD kCollecting = 20;  // milliseconds; the system's own counters of processes take about as long

struct Sample {
  DWORD processId = 0;           // 0: there is no such process
  ULONGLONG time = 0, busy = 0;  // in 100 ns
};

struct Query {
  std::wstring program;
  Sample before, last;
};

ULONGLONG Ticks(const FILETIME& time) {
  return (static_cast<ULONGLONG>(time.dwHighDateTime) << 32) | time.dwLowDateTime;
}

DWORD FindProcess(const std::wstring& program) {
  const KernelHandle snapshot(CreateToolhelp32Snapshot(TH32CS_SNAPPROCESS, 0));
  PROCESSENTRY32W entry{};
  entry.dwSize = sizeof entry;
  for (BOOL more = Process32FirstW(snapshot.Get(), &entry); more; more = Process32NextW(snapshot.Get(), &entry)) {
    if (program == entry.szExeFile) return entry.th32ProcessID;
  }
  return 0;
}

Sample TakeSample(const std::wstring& program) {
  Sleep(kCollecting);
  Sample sample;
  const DWORD id = FindProcess(program);
  const KernelHandle process(OpenProcess(PROCESS_QUERY_LIMITED_INFORMATION, FALSE, id));
  FILETIME created, ended, kernel, user, now;
  if (id == 0 || !process || !GetProcessTimes(process.Get(), &created, &ended, &kernel, &user)) return sample;
  GetSystemTimePreciseAsFileTime(&now);
  return {id, Ticks(now), Ticks(kernel) + Ticks(user)};
}

}  // namespace

extern "C" {

PDH_FUNCTION PdhOpenQueryW(LPCWSTR, DWORD_PTR, PDH_HQUERY* query) {
  *query = std::make_unique<Query>().release();
  return ERROR_SUCCESS;
}

PDH_FUNCTION PdhAddCounterW(PDH_HQUERY query, LPCWSTR path, DWORD_PTR, PDH_HCOUNTER* counter) {
  const std::wstring_view text(path);
  if (!text.starts_with(kBegin) || !text.ends_with(kEnd)) return PDH_CSTATUS_NO_OBJECT;
  const size_t length = text.size() - kBegin.size() - kEnd.size();
  static_cast<Query*>(query)->program = std::wstring(text.substr(kBegin.size(), length)) + L".exe";
  *counter = query;
  return ERROR_SUCCESS;
}

PDH_FUNCTION PdhCollectQueryData(PDH_HQUERY query) {
  auto& state = *static_cast<Query*>(query);
  if (state.program.empty()) return PDH_NO_DATA;
  state.before = state.last;
  state.last = TakeSample(state.program);
  return state.last.processId == 0 ? PDH_NO_DATA : ERROR_SUCCESS;
}

PDH_FUNCTION PdhGetFormattedCounterValue(PDH_HCOUNTER counter, DWORD, LPDWORD, PPDH_FMT_COUNTERVALUE value) {
  if (counter == nullptr || counter == INVALID_HANDLE_VALUE) return PDH_INVALID_HANDLE;
  const auto& state = *static_cast<const Query*>(counter);
  const bool isRate = state.before.processId != 0 && state.before.processId == state.last.processId;
  if (!isRate || state.last.time <= state.before.time) return PDH_INVALID_DATA;
  value->CStatus = ERROR_SUCCESS;
  value->doubleValue = 100.0 * static_cast<double>(state.last.busy - state.before.busy) /
                       static_cast<double>(state.last.time - state.before.time);
  return ERROR_SUCCESS;
}

PDH_FUNCTION PdhCloseQuery(PDH_HQUERY query) {
  const std::unique_ptr<Query> owner(static_cast<Query*>(query));
  return ERROR_SUCCESS;
}

}  // extern "C"
