// The open handles of processes. The table of the whole system is taken once, when the helper is made, and grouped by
// process once; handles opened or closed later are not seen. One thread at a time.
#pragma once

#include <windows.h>
// windows.h has to come first.
#include <winternl.h>

#include <string>
#include <vector>

#include "systeminfo/handle_table.h"
#include "systeminfo/handle_types.h"

struct HandleInfo {
  uint64_t value = 0;
  std::wstring name;  // always empty: asking for an object's name can block for ever, so it is never done
  std::wstring type;
};

// The entry points of ntdll.dll that the helper needs. All null when one is missing.
struct HandleCalls {
  decltype(&NtQuerySystemInformation) querySystem = nullptr;
  systeminfo::ObjectCalls object;

  static HandleCalls OfSystem();
};

class ProcessHandlerHelper {
 public:
  // A handle that does not tell its type for longer than `limit` is passed over.
  explicit ProcessHandlerHelper(const HandleCalls& calls = HandleCalls::OfSystem(),
                                std::chrono::milliseconds limit = std::chrono::seconds(2));

  // Appends the handles of the process, in the order of the system's table, but those that are closed meanwhile or do
  // not tell their type.
  void GetHandleInformationForProcess(uint32_t processId, std::vector<HandleInfo>& handles);

 private:
  bool TakeSnapshot(const HandleCalls& calls);

  systeminfo::HandleTable m_table;
  bool m_isValid = false;
  systeminfo::HandleTypeReader m_typeReader;
};
