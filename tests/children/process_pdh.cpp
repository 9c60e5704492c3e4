// A stand-in for the system's pdh.dll where that has no counters of processes: "\Process(NAME)\% Processor Time" of the
// first running program NAME.exe, from the system's own process times. Lies beside the program under the name pdh.dll.
#include <windows.h>

#include <pdh.h>
#include <pdhmsg.h>
#include <winternl.h>

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace {

constexpr std::wstring_view kBegin = L"\\Process(";
constexpr std::wstring_view kEnd = L")\\% Processor Time";
constexpr DWORD kCollecting = 50;  // milliseconds; the system's own counters of processes take their time, too

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

// The beginning of an entry of the system's process list, which the header does not spell out.
struct ProcessEntry {
  ULONG nextOffset;  // 0: the last one
  ULONG threads;
  LARGE_INTEGER reserved[3];
  LARGE_INTEGER created, user, kernel;  // in 100 ns
  UNICODE_STRING program;
  ULONG priority;
  HANDLE processId;
};

std::vector<std::byte> ProcessList() {
  std::vector<std::byte> list(size_t{1} << 16);
  ULONG size = 0;
  while (NtQuerySystemInformation(SystemProcessInformation, list.data(), static_cast<ULONG>(list.size()), &size) < 0) {
    if (list.size() > size_t{1} << 26) return {};
    list.resize(list.size() * 2);
  }
  return list;
}

Sample TakeSample(const std::wstring& program) {
  Sleep(kCollecting);
  const std::vector<std::byte> list = ProcessList();
  FILETIME now;
  GetSystemTimePreciseAsFileTime(&now);
  for (size_t offset = 0; offset + sizeof(ProcessEntry) <= list.size();) {
    const auto& entry = *reinterpret_cast<const ProcessEntry*>(list.data() + offset);
    if (program == std::wstring_view(entry.program.Buffer, entry.program.Length / sizeof(wchar_t))) {
      return {static_cast<DWORD>(reinterpret_cast<ULONG_PTR>(entry.processId)), Ticks(now),
              static_cast<ULONGLONG>(entry.user.QuadPart + entry.kernel.QuadPart)};
    }
    if (entry.nextOffset == 0) break;
    offset += entry.nextOffset;
  }
  return {};
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
