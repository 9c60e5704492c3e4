// Counts the dumps of one run against the limits. Thread-safe; no Windows header.
#pragma once

#include <cstdint>
#include <map>
#include <mutex>
#include <optional>
#include <string>

#include "monitoring/limits.h"

namespace st::monitoring {

class DumpBudget {
 public:
  using Refusal = std::optional<std::wstring>;  // why not; empty: it may

  explicit DumpBudget(const Limits& limits) : m_limits(limits) {}

  // Asks for one dump of the process, which is counted when it may. `freeDiskBytes` is empty when the system does not
  // say.
  Refusal Begin(uint32_t processId, std::optional<uint64_t> freeDiskBytes);

  // The dump is written, but not yet under its final name: its bytes are counted when they may be.
  Refusal Keep(uint64_t bytes);

  // Nothing came of a dump that Begin counted; `bytes` is what Keep counted of it.
  void GiveBack(uint32_t processId, uint64_t bytes);

 private:
  const Limits m_limits;
  std::mutex m_mutex;
  uint64_t m_dumps = 0;
  uint64_t m_totalBytes = 0;
  std::map<uint32_t, uint64_t> m_dumpsOfProcess;
};

}  // namespace st::monitoring
