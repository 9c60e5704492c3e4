// The collector "windows_events": the records that the event logs Application and System got in the last 30 days,
// newest first, each with the text that its source's message library has for it. Reading, the records' bytes, the
// libraries and the rules stand apart from each other; this joins them.
#pragma once

#include <map>
#include <string>
#include <string_view>
#include <utility>

#include "systeminfo/collector.h"
#include "systeminfo/event_log.h"
#include "systeminfo/event_record.h"
#include "systeminfo/library_loader_cache.h"

namespace systeminfo {

class EventLogCollector : public ICollector {
 public:
  explicit EventLogCollector(std::wstring name, EventLogOpener open = &OpenWindowsEventLog);

  // The data are an object with an array for each of the two logs, empty when the log cannot be read. `cancel` is
  // polled before every read.
  void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override;

  // Appends the records of one log to the array `records`.
  void ReadEventLogForSource(const std::wstring& logName, Json::Value& records, const std::atomic<bool>* cancel);

  // Appends the records of one buffer to the array `batch`. False when one of them was too old: those behind it, in
  // this buffer and in the log, are older still.
  bool DumpRecordsBatch(const char* buffer, size_t bytesRead, Json::Value& batch);

 private:
  Json::Value ToJson(const EventRecord& record);
  const std::string& Message(HMODULE module, DWORD eventId);

  EventLogOpener m_open;
  LibraryLoaderCache m_libraries;
  std::map<std::pair<HMODULE, DWORD>, std::string> m_messages;  // few texts serve many records; empty: there is none
};

// A record's time as the file shows it: "3/4/2024 09:05:07", the month first.
std::string FormatEventTime(const SYSTEMTIME& time);

}  // namespace systeminfo
