// One of the classic event logs of this machine, read backwards. The interface is what the collector needs of it; it
// stands apart so that a log can have any content in tests.
#pragma once

#include <windows.h>

#include <functional>
#include <memory>
#include <string>

namespace systeminfo {

class EventLog {
 public:
  virtual ~EventLog() = default;

  // Fills `buffer` with as many whole records as fit, the newest of those not read yet first. Returns 0 or the Windows
  // error number: ERROR_HANDLE_EOF behind the oldest record; ERROR_INSUFFICIENT_BUFFER when not even one fits, and
  // `bytesNeeded` is what it takes.
  virtual DWORD Read(char* buffer, DWORD size, DWORD& bytesRead, DWORD& bytesNeeded) = 0;
};

// Opens the log of that name. Returns 0 or the Windows error number.
using EventLogOpener = std::function<DWORD(const std::wstring& logName, std::unique_ptr<EventLog>& log)>;

DWORD OpenWindowsEventLog(const std::wstring& logName, std::unique_ptr<EventLog>& log);

}  // namespace systeminfo
