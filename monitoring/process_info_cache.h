// A snapshot of the running processes, for an action that looks for those to dump.
#pragma once

#include <windows.h>

#include <string>
#include <string_view>
#include <vector>

#include "core/scoped.h"

namespace st::monitoring {

struct ProcessRecord {
  DWORD id = 0;
  KernelHandle handle;  // all access
  std::wstring name;    // full path of the image; empty when the system does not say
};

// Used by one thread at a time. A record's handle keeps its process id from being given to another process.
class ProcessInfoCache {
 public:
  // Takes a new snapshot in place of the old one. Processes that may not be opened with all access are not in it: they
  // could not be dumped either.
  bool TakeProceessesSnapshot();

  const ProcessRecord* GetProcessDataByPid(DWORD id) const;  // null when there is none

  // The records whose path contains the text, case-sensitive, in snapshot order. An unknown path contains nothing.
  std::vector<const ProcessRecord*> GetProcessesByName(std::wstring_view text) const;

  static std::wstring GetProcessName(HANDLE process);

 private:
  std::vector<ProcessRecord> m_records;
};

}  // namespace st::monitoring
