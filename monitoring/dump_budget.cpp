#include "monitoring/dump_budget.h"

namespace st::monitoring {
namespace {

std::wstring Reached(const wchar_t* name, uint64_t limit) {
  return std::wstring(name) + L" is " + std::to_wstring(limit);
}

}  // namespace

DumpBudget::Refusal DumpBudget::Begin(uint32_t processId, std::optional<uint64_t> freeDiskBytes) {
  const std::lock_guard lock(m_mutex);
  if (m_limits.maxDumps && m_dumps >= *m_limits.maxDumps) return Reached(L"maxDumps", *m_limits.maxDumps);
  uint64_t& ofProcess = m_dumpsOfProcess[processId];
  if (m_limits.maxDumpsPerProcess && ofProcess >= *m_limits.maxDumpsPerProcess) {
    return Reached(L"maxDumpsPerProcess", *m_limits.maxDumpsPerProcess);
  }
  if (m_limits.maxTotalDumpBytes && m_totalBytes >= *m_limits.maxTotalDumpBytes) {
    return Reached(L"maxTotalDumpBytes", *m_limits.maxTotalDumpBytes);
  }
  if (m_limits.minFreeDiskBytes && freeDiskBytes.value_or(0) < *m_limits.minFreeDiskBytes) {
    return Reached(L"minFreeDiskBytes", *m_limits.minFreeDiskBytes) +
           (freeDiskBytes ? L" and " + std::to_wstring(*freeDiskBytes) + L" are free"
                          : std::wstring(L" and the free space is unknown"));
  }
  ++m_dumps;
  ++ofProcess;
  return std::nullopt;
}

DumpBudget::Refusal DumpBudget::Keep(uint64_t bytes) {
  const std::lock_guard lock(m_mutex);
  // Written so that no sum can overflow.
  if (m_limits.maxTotalDumpBytes && bytes > *m_limits.maxTotalDumpBytes - m_totalBytes) {
    return Reached(L"maxTotalDumpBytes", *m_limits.maxTotalDumpBytes) + L", there are " +
           std::to_wstring(m_totalBytes) + L" and this dump has " + std::to_wstring(bytes);
  }
  m_totalBytes += bytes;
  return std::nullopt;
}

void DumpBudget::GiveBack(uint32_t processId, uint64_t bytes) {
  const std::lock_guard lock(m_mutex);
  --m_dumps;
  --m_dumpsOfProcess[processId];
  m_totalBytes -= bytes;
}

}  // namespace st::monitoring
