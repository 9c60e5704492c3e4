// The processes that ran when the snapshot was taken, each with its image path and a handle that stays open as long as
// the cache lives. One thread at a time.
#pragma once

#include <windows.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "core/scoped.h"

namespace systeminfo {

struct ProcessRecord {
  KernelHandle process;  // with all access; invalid when it could not be opened
  uint32_t processId = 0;
  std::wstring imagePath;  // may be empty
};

class ProcessInfoCache {
 public:
  // Appends the running processes by ascending id to what an earlier call has found.
  void TakeProceessesSnapshot();

  // Empty on failure. `process` needs the right to query information.
  static std::wstring GetProcessName(HANDLE process);

  // The image path; empty when the snapshot has no such process.
  std::wstring GetProcessDataByPid(uint32_t processId) const;

  // Those whose image path contains `text`, case-sensitively, in the order of the snapshot. The handles belong to the
  // cache and may be null. A record without a path never matches.
  std::vector<std::pair<uint32_t, HANDLE>> GetProcessesByName(std::wstring_view text) const;

  const std::vector<ProcessRecord>& Records() const { return m_records; }

 private:
  std::vector<ProcessRecord> m_records;
};

}  // namespace systeminfo
