// The types ("File", "Key", …) of handles that another process has open. Each handle is duplicated and its duplicate
// asked; because the kernel may keep such a call waiting for as long as it likes, the calls run on a thread of their
// own, and one that does not come back is given up.
#pragma once

#include <windows.h>
// windows.h has to come first.
#include <winternl.h>

#include <chrono>
#include <optional>
#include <span>
#include <string>
#include <vector>

#include "core/scoped.h"

namespace systeminfo {

// The calls of ntdll.dll. The system's headers do not declare the first one.
struct ObjectCalls {
  NTSTATUS(NTAPI* duplicate)
  (HANDLE sourceProcess, HANDLE source, HANDLE targetProcess, HANDLE* target, ACCESS_MASK access, ULONG attributes,
   ULONG options) = nullptr;
  decltype(&NtQueryObject) query = nullptr;
};

class HandleTypeReader {
 public:
  // A call is given up when it takes longer than `limit`, at the latest after twice that.
  HandleTypeReader(const ObjectCalls& calls, std::chrono::milliseconds limit) : m_calls(calls), m_limit(limit) {}

  // One answer for each value, nothing where the handle is gone or does not tell its type. After kMostGivenUp calls in
  // the life of the reader nothing is asked any more: each of them leaves a thread behind.
  std::vector<std::optional<std::wstring>> Read(KernelHandle process, std::span<const uint16_t> values);

  static constexpr int kMostGivenUp = 8;

 private:
  const ObjectCalls m_calls;
  const std::chrono::milliseconds m_limit;
  int m_givenUp = 0;
};

}  // namespace systeminfo
