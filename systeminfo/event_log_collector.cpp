#include "systeminfo/event_log_collector.h"

#include <algorithm>
#include <chrono>
#include <new>

#include "core/format.h"
#include "core/logging.h"
#include "core/text.h"

namespace systeminfo {
namespace {

constexpr wchar_t kReadEventLogForSource[] = L"systeminfo::EventLogCollector::ReadEventLogForSource";
constexpr wchar_t kDumpRecordsBatch[] = L"systeminfo::EventLogCollector::DumpRecordsBatch";

constexpr DWORD kFirstBufferSize = 0x10000;
constexpr DWORD kLargestBufferSize = 0x7FFFF;  // ReadEventLog takes no more; no record is larger

// Gives the buffer exactly `size` bytes, of no particular content. False when there is no memory for them.
bool Reallocate(std::string& buffer, DWORD size) {
  try {
    buffer = std::string(size, '\0');
    return true;
  } catch (const std::bad_alloc&) {
    return false;
  }
}

SYSTEMTIME LocalTime(uint32_t secondsSince1970) {
  constexpr uint64_t kSecondsFrom1601To1970 = 11'644'473'600;
  const uint64_t ticks = (secondsSince1970 + kSecondsFrom1601To1970) * 10'000'000;
  const FILETIME utc{static_cast<DWORD>(ticks), static_cast<DWORD>(ticks >> 32)};
  FILETIME local{};
  SYSTEMTIME time{};
  FileTimeToLocalFileTime(&utc, &local);
  FileTimeToSystemTime(&local, &time);
  return time;
}

int64_t SecondsSince1970() {
  const auto now = std::chrono::system_clock::now().time_since_epoch();
  return std::chrono::duration_cast<std::chrono::seconds>(now).count();
}

}  // namespace

EventLogCollector::EventLogCollector(std::wstring name, EventLogOpener open)
    : ICollector(std::move(name)), m_open(std::move(open)) {}

void EventLogCollector::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>&,
                              const std::atomic<bool>* cancel) {
  m_data = Json::Value(Json::objectValue);
  for (const char* log : {"Application", "System"}) {
    Json::Value& records = m_data[log] = Json::Value(Json::arrayValue);
    ReadEventLogForSource(ToWide(log), records, cancel);
  }
}

void EventLogCollector::ReadEventLogForSource(const std::wstring& logName, Json::Value& records,
                                              const std::atomic<bool>* cancel) {
  m_libraries.SetLogName(logName);
  std::unique_ptr<EventLog> log;
  if (const DWORD error = m_open(logName, log); error != ERROR_SUCCESS) {
    LOG_ERROR(kReadEventLogForSource, L"OpenEventLog failed with 0x%x.\n", error);
    return;
  }
  std::string buffer;
  if (!Reallocate(buffer, kFirstBufferSize)) {
    LOG_ERROR(kReadEventLogForSource, L"Failed to allocate the initial memory for the record buffer.");
    return;
  }
  while (!IsCancelled(cancel)) {
    const auto size = static_cast<DWORD>(buffer.size());
    DWORD bytesRead = 0;
    DWORD bytesNeeded = 0;
    const DWORD error = log->Read(buffer.data(), size, bytesRead, bytesNeeded);
    if (error == ERROR_SUCCESS) {
      // Nothing read is no record to come either; and whatever it is said to be, the buffer ends where it ends.
      if (bytesRead == 0 || !DumpRecordsBatch(buffer.data(), std::min<size_t>(bytesRead, size), records)) return;
    } else if (error == ERROR_INSUFFICIENT_BUFFER && bytesNeeded > size) {
      if (bytesNeeded > kLargestBufferSize || !Reallocate(buffer, bytesNeeded)) {
        LOG_ERROR(kReadEventLogForSource, L"Failed to reallocate the memory for the record buffer (%d bytes).\n",
                  bytesNeeded);
        return;
      }
    } else {
      if (error != ERROR_HANDLE_EOF) LOG_ERROR(kReadEventLogForSource, L"ReadEventLog failed with %lu.\n", error);
      return;
    }
  }
}

bool EventLogCollector::DumpRecordsBatch(const char* buffer, size_t bytesRead, Json::Value& batch) {
  const int64_t now = SecondsSince1970();
  EventRecordReader reader(std::string_view(buffer, bytesRead));
  EventRecord record;
  while (reader.Next(record)) {
    const bool isTooOld = IsTooOld(now, record.timeGenerated);
    if (reader.Damage() != nullptr) {
      LOG_WARNING(kDumpRecordsBatch, L"The record of %S at byte %u of the buffer is damaged: %S",
                  record.sourceName.c_str(), static_cast<unsigned>(reader.Offset()), reader.Damage());
      if (isTooOld) continue;  // its time proves nothing about those behind it
    }
    if (isTooOld) return false;
    batch.append(ToJson(record));
  }
  if (reader.Damage() != nullptr) {
    LOG_WARNING(kDumpRecordsBatch, L"The records from byte %u of the buffer on are lost: %S",
                static_cast<unsigned>(reader.Offset()), reader.Damage());
  }
  return true;
}

Json::Value EventLogCollector::ToJson(const EventRecord& record) {
  static const Json::StaticString kTimeGenerated("TimeGenerated");
  static const Json::StaticString kEventType("EventType");
  static const Json::StaticString kSourceName("SourceName");
  static const Json::StaticString kComputername("Computername");
  static const Json::StaticString kMessage("message");
  static const Json::StaticString kInsertionStrings("InsertionStrings");

  Json::Value json(Json::objectValue);
  json[kTimeGenerated] = FormatEventTime(LocalTime(record.timeGenerated));
  json[kEventType] = std::to_string(record.eventType);
  json[kSourceName] = record.sourceName;
  json[kComputername] = record.computerName;
  const std::wstring source = ToWide(record.sourceName);
  const HMODULE module = m_libraries.Load(source) ? m_libraries.Find(source) : nullptr;
  if (module == nullptr) {
    LOG_TRACE(kDumpRecordsBatch, L"library handle was not memoized previosly. skipping %s", source.c_str());
  } else if (const std::string& message = Message(module, record.eventId); !message.empty()) {
    json[kMessage] = message;
  }
  Json::Value& strings = json[kInsertionStrings] = Json::Value(Json::arrayValue);
  for (const std::string& string : record.insertionStrings)
    strings.append(string);
  return json;
}

const std::string& EventLogCollector::Message(HMODULE module, DWORD eventId) {
  const auto [place, isNew] = m_messages.try_emplace({module, eventId});
  if (isNew) place->second = ToUtf8(GetMessageString(module, eventId));
  return place->second;
}

std::string FormatEventTime(const SYSTEMTIME& time) {
  return ToUtf8(
      Format(L"%d/%d/%d %.2d:%.2d:%.2d", time.wMonth, time.wDay, time.wYear, time.wHour, time.wMinute, time.wSecond));
}

}  // namespace systeminfo
