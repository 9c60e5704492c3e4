#include "systeminfo/event_log.h"

#include <utility>

#include "core/scoped.h"

namespace systeminfo {
namespace {

struct EventLogHandleTraits {
  using Type = HANDLE;
  static bool IsValid(HANDLE log) { return log != nullptr; }
  static void Close(HANDLE log) { CloseEventLog(log); }
};
using EventLogHandle = Scoped<EventLogHandleTraits>;

class WindowsEventLog : public EventLog {
 public:
  explicit WindowsEventLog(EventLogHandle handle) : m_handle(std::move(handle)) {}

  DWORD Read(char* buffer, DWORD size, DWORD& bytesRead, DWORD& bytesNeeded) override {
    constexpr DWORD kFlags = EVENTLOG_SEQUENTIAL_READ | EVENTLOG_BACKWARDS_READ;
    if (ReadEventLogW(m_handle.Get(), kFlags, 0, buffer, size, &bytesRead, &bytesNeeded)) return ERROR_SUCCESS;
    return GetLastError();
  }

 private:
  EventLogHandle m_handle;
};

}  // namespace

DWORD OpenWindowsEventLog(const std::wstring& logName, std::unique_ptr<EventLog>& log) {
  EventLogHandle handle(OpenEventLogW(nullptr, logName.c_str()));
  if (!handle) return GetLastError();
  log = std::make_unique<WindowsEventLog>(std::move(handle));
  return ERROR_SUCCESS;
}

}  // namespace systeminfo
