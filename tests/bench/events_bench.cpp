// events_bench records|document ours|library|none FILE: 20,000 event records to an indented JSON file. "records" is the
// whole job from the log's buffers on, "document" only the writing of a document that is there already; the text comes
// from the program's writer or from Json::StyledWriter, or there is none. Prints the job's time and the peak memory.
#include <json/writer.h>

#include <ctime>
#include <string_view>
#include <vector>

#include "core/files.h"
#include "systeminfo/data_collector.h"
#include "systeminfo/event_log_collector.h"
#include "tests/bench/measure.h"
#include "tests/support/event_records.h"
#include "tests/support/test_registry.h"

namespace {

constexpr uint32_t kRecords = 20'000;

// A log that makes its records as they are read, so that it takes no memory of its own.
class MadeLog : public systeminfo::EventLog {
 public:
  DWORD Read(char* buffer, DWORD size, DWORD& bytesRead, DWORD&) override {
    bytesRead = 0;
    while (m_count < kRecords) {
      const std::string record = MakeRecord(m_count);
      if (record.size() > size - bytesRead) break;
      std::copy(record.begin(), record.end(), buffer + bytesRead);
      bytesRead += static_cast<DWORD>(record.size());
      ++m_count;
    }
    return bytesRead != 0 ? ERROR_SUCCESS : ERROR_HANDLE_EOF;
  }

 private:
  // Of every ten records six have a message; every fourth has text outside ASCII.
  std::string MakeRecord(uint32_t index) const {
    event_records::Fields fields;
    fields.timeGenerated = m_now - index;
    fields.eventId = 2 + index % 30;  // texts of the system, which fall back to it
    fields.source = index % 10 < 6 ? u"Service Control Manager" : u"Source without a library";
    fields.computer = u"DESKTOP-4F7K2Q1";
    fields.strings = {u"Windows Update", u"C:\\Windows\\System32\\svchost.exe -k netsvcs -p", u"0x80070005"};
    if (index % 4 == 0)
      fields.strings.emplace_back(u"Der Dienst wurde nicht rechtzeitig ausgef\u00FChrt \u2013 Fehler");
    return event_records::Make(fields);
  }

  uint32_t m_count = 0;
  const uint32_t m_now = static_cast<uint32_t>(std::time(nullptr));
};

DWORD OpenMadeLog(const std::wstring& name, std::unique_ptr<systeminfo::EventLog>& log) {
  if (name != L"System") return ERROR_FILE_NOT_FOUND;
  log = std::make_unique<MadeLog>();
  return ERROR_SUCCESS;
}

bool Write(const Json::Value& document, std::wstring_view writer, const wchar_t* path) {
  uint64_t bytes = 0;
  if (writer == L"ours") return systeminfo::DataCollectorImpl::WriteJsonFile(path, document, true, bytes) == 0;
  return writer == L"none" || WriteWholeFile(path, Json::StyledWriter().write(document)) == 0;
}

}  // namespace

int wmain(int argumentCount, wchar_t** arguments) {
  if (argumentCount != 4) {
    std::fputs("usage: events_bench records|document ours|library|none FILE\n", stderr);
    return 2;
  }
  const TestRegistryKey machine;
  const RedirectedHive hive(HKEY_LOCAL_MACHINE, machine.MakeKey({}));
  machine.SetText(L"SYSTEM\\CurrentControlSet\\Services\\Eventlog\\System\\Service Control Manager",
                  L"EventMessageFile", L"%SystemRoot%\\System32\\kernel32.dll", REG_EXPAND_SZ);
  systeminfo::EventLogCollector collector(L"windows_events", &OpenMadeLog);
  const bool isWholeJob = std::wstring_view(arguments[1]) == L"records";
  if (!isWholeJob) collector.Start(nullptr, nullptr, nullptr);
  const bool isWritten = Measure([&] {
    if (isWholeJob) collector.Start(nullptr, nullptr, nullptr);
    return Write(collector.Data(), arguments[2], arguments[3]);
  });
  return isWritten && collector.Data()["System"].size() == kRecords ? 0 : 1;
}
