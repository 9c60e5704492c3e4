#include "systeminfo/handle_snapshot.h"

#include <cstdio>

#include "core/logging.h"

namespace {

constexpr auto kSystemHandleInformation = static_cast<SYSTEM_INFORMATION_CLASS>(16);
constexpr auto kInfoLengthMismatch = static_cast<NTSTATUS>(0xC0000004);
constexpr size_t kFirstSize = 4096;
constexpr size_t kLargestSize = size_t{1} << 30;  // more than 40 million handles

template <class Function>
Function EntryPoint(const char* name) {
  return reinterpret_cast<Function>(reinterpret_cast<void*>(GetProcAddress(GetModuleHandleW(L"ntdll.dll"), name)));
}

}  // namespace

HandleCalls HandleCalls::OfSystem() {
  HandleCalls calls;
  calls.querySystem = EntryPoint<decltype(calls.querySystem)>("NtQuerySystemInformation");
  calls.object.duplicate = EntryPoint<decltype(calls.object.duplicate)>("NtDuplicateObject");
  calls.object.query = EntryPoint<decltype(calls.object.query)>("NtQueryObject");
  const bool areAllThere =
      calls.querySystem != nullptr && calls.object.duplicate != nullptr && calls.object.query != nullptr;
  return areAllThere ? calls : HandleCalls();
}

ProcessHandlerHelper::ProcessHandlerHelper(const HandleCalls& calls, std::chrono::milliseconds limit)
    : m_typeReader(calls.object, limit) {
  m_isValid = calls.querySystem != nullptr && TakeSnapshot(calls);
}

bool ProcessHandlerHelper::TakeSnapshot(const HandleCalls& calls) {
  std::vector<char> reply(kFirstSize);
  NTSTATUS status = 0;
  for (;;) {
    status = calls.querySystem(kSystemHandleInformation, reply.data(), static_cast<ULONG>(reply.size()), nullptr);
    if (status != kInfoLengthMismatch || reply.size() >= kLargestSize) break;
    const size_t size = reply.size() * 2;
    reply.clear();  // nothing of it has to be moved
    reply.resize(size);
  }
  if (status < 0) {
    std::printf("NtQuerySystemInformation failed!\n");
    LOG_ERROR(L"ProcessHandlerHelper::ProcessHandlerHelper", L"the table of handles cannot be taken, status %x",
              static_cast<unsigned>(status));
    return false;
  }
  m_table = systeminfo::HandleTable({reply.data(), reply.size()});
  if (m_table.MissingEntries() != 0) {
    LOG_ERROR(L"ProcessHandlerHelper::ProcessHandlerHelper", L"the table of handles lacks %llu of its entries",
              static_cast<unsigned long long>(m_table.MissingEntries()));
  }
  return true;
}

void ProcessHandlerHelper::GetHandleInformationForProcess(uint32_t processId, std::vector<HandleInfo>& handles) {
  if (!m_isValid) return;
  KernelHandle process(OpenProcess(PROCESS_ALL_ACCESS, FALSE, processId));
  if (!process) {
    const DWORD error = GetLastError();
    LOG_TRACE(L"ProcessHandlerHelper::GetHandleInformationForProcess",
              L"Could not open PID %d!(Don't try to open a system process.)\n", static_cast<int>(processId));
    LOG_TRACE(L"ProcessHandlerHelper::GetHandleInformationForProcess", L"error %u", error);
    return;
  }
  const auto values = m_table.HandlesOf(processId);
  auto types = m_typeReader.Read(std::move(process), values);
  for (size_t i = 0; i < values.size(); ++i) {
    if (types[i]) handles.push_back({values[i], {}, *std::move(types[i])});
  }
}
