#include "systeminfo/event_log_collector.h"

#include <gmock/gmock.h>

#include <ctime>
#include <deque>
#include <thread>

#include "core/logging.h"
#include "core/program_path.h"
#include "systeminfo/wmi_wrapper.h"
#include "tests/support/event_records.h"
#include "tests/support/test_registry.h"

namespace systeminfo {
namespace {

using event_records::Make;
using testing::AllOf;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr uint32_t kDay = 24 * 60 * 60;

uint32_t Ago(uint32_t seconds) {
  return static_cast<uint32_t>(std::time(nullptr)) - seconds;
}

// Event logs whose content, and what happens to it while it is read, is the test's.
struct FakeLogs {
  struct Log {
    std::deque<std::string> records;  // newest first; what was read is gone from here
    DWORD openError = ERROR_SUCCESS;
    DWORD readError = ERROR_HANDLE_EOF;  // when no record is left
    size_t recordsPerRead = SIZE_MAX;
    std::function<void(Log&)> beforeRead = [](Log&) {};
    std::vector<DWORD> bufferSizes;  // of the reads
  };
  std::map<std::wstring, Log> logs;

  class Reader : public EventLog {
   public:
    explicit Reader(Log& log) : m_log(log) {}
    DWORD Read(char* buffer, DWORD size, DWORD& bytesRead, DWORD& bytesNeeded) override {
      m_log.beforeRead(m_log);
      m_log.bufferSizes.push_back(size);
      bytesRead = 0;
      for (size_t count = 0; count < m_log.recordsPerRead && !m_log.records.empty(); ++count) {
        const std::string& record = m_log.records.front();
        if (record.size() > size - bytesRead) {
          bytesNeeded = static_cast<DWORD>(record.size());
          return bytesRead != 0 ? ERROR_SUCCESS : ERROR_INSUFFICIENT_BUFFER;
        }
        std::copy(record.begin(), record.end(), buffer + bytesRead);
        bytesRead += static_cast<DWORD>(record.size());
        m_log.records.pop_front();
      }
      return bytesRead != 0 ? ERROR_SUCCESS : m_log.readError;
    }

   private:
    Log& m_log;
  };

  EventLogOpener Opener() {
    return [this](const std::wstring& name, std::unique_ptr<EventLog>& log) {
      if (logs[name].openError == ERROR_SUCCESS) log = std::make_unique<Reader>(logs[name]);
      return logs[name].openError;
    };
  }
};

std::string Record(uint32_t age, const std::u16string& source = u"Source") {
  return Make({Ago(age), 1, 4, source});
}

std::vector<std::string> Sources(const Json::Value& records) {
  std::vector<std::string> sources;
  for (const Json::Value& record : records)
    sources.push_back(record["SourceName"].asString());
  return sources;
}

class EventLogCollectorTest : public testing::Test {
 protected:
  Json::Value Collect() {
    EventLogCollector collector(L"windows_events", m_logs.Opener());
    collector.Start(nullptr, nullptr, &m_cancel);
    return collector.GetData();
  }

  // What is read of a log that answers as the function says.
  static Json::Value ReadScripted(std::function<DWORD(char* buffer, DWORD& bytesRead, DWORD& bytesNeeded)> read) {
    struct Log : EventLog {
      explicit Log(decltype(read) function) : m_read(std::move(function)) {}
      DWORD Read(char* buffer, DWORD, DWORD& bytesRead, DWORD& bytesNeeded) override {
        return m_read(buffer, bytesRead, bytesNeeded);
      }
      decltype(read) m_read;
    };
    EventLogCollector collector(L"windows_events", [&read](const std::wstring&, std::unique_ptr<EventLog>& log) {
      log = std::make_unique<Log>(read);
      return DWORD{ERROR_SUCCESS};
    });
    Json::Value records(Json::arrayValue);
    collector.ReadEventLogForSource(L"System", records, nullptr);
    return records;
  }

  // The lines of the function, without its name.
  std::vector<std::wstring> Lines(const std::wstring& function) {
    const std::wstring scope = L"systeminfo::EventLogCollector::" + function + L": ";
    std::vector<std::wstring> lines;
    for (const std::wstring& line : m_log.Take()) {
      if (line.starts_with(scope)) lines.push_back(line.substr(scope.size()));
    }
    return lines;
  }

  FakeLogs m_logs;
  FakeLogs::Log& m_application = m_logs.logs[L"Application"];
  FakeLogs::Log& m_system = m_logs.logs[L"System"];
  std::atomic<bool> m_cancel{false};
  TestRegistryKey m_machine;
  RedirectedHive m_hive{HKEY_LOCAL_MACHINE, m_machine.MakeKey({})};
  logging::ErrorCapture m_log{logging::Level::kTrace};
};

TEST_F(EventLogCollectorTest, RecordsBecomeObjectsWithTheMessageOfTheirSource) {
  m_machine.SetText(L"SYSTEM\\CurrentControlSet\\Services\\Eventlog\\System\\Known", L"EventMessageFile",
                    ProgramFolder() + L"\\message_library.dll");
  const uint32_t time = Ago(5);
  m_system.records = {Make({time, 0xC0001000, 1, u"Known", u"R\u00C4UBER", {u"spooler", u"%1", u""}}),
                      Make({time, 0xDEADBEEF, 0xFFFF, u"Known", u"PC", {}}), Make({time, 1, 4, u"Unknown", u"PC", {}})};
  const Json::Value data = Collect();
  EXPECT_THAT(data.getMemberNames(), ElementsAre("Application", "System"));
  EXPECT_EQ(data["Application"], Json::Value(Json::arrayValue));
  const Json::Value& records = data["System"];
  ASSERT_EQ(records.size(), 3u);
  Json::Value expected;
  expected["TimeGenerated"] = records[0]["TimeGenerated"];
  expected["EventType"] = "1";
  expected["SourceName"] = "Known";
  expected["Computername"] = "R\xC3\x84UBER";
  expected["message"] = "The service %1 ended with %2!s!, %99 and %%4096.\r\n";
  expected["InsertionStrings"].append("spooler");
  expected["InsertionStrings"].append("%1");
  expected["InsertionStrings"].append("");
  EXPECT_EQ(records[0], expected);
  EXPECT_EQ(records[1]["EventType"], "65535");
  EXPECT_EQ(records[1]["InsertionStrings"], Json::Value(Json::arrayValue));
  EXPECT_FALSE(records[1].isMember("message")) << "no such text";
  EXPECT_FALSE(records[2].isMember("message"));
  EXPECT_THAT(Lines(L"DumpRecordsBatch"), ElementsAre(L"library handle was not memoized previosly. skipping Unknown"));
}

TEST_F(EventLogCollectorTest, TimesAreLocalWithTheMonthFirst) {
  EXPECT_EQ(FormatEventTime({2024, 3, 1, 4, 9, 5, 7, 0}), "3/4/2024 09:05:07");
  EXPECT_EQ(FormatEventTime({2024, 12, 2, 31, 23, 59, 59, 999}), "12/31/2024 23:59:59");

  SYSTEMTIME before{};
  SYSTEMTIME after{};
  GetLocalTime(&before);
  m_system.records = {Record(0)};
  const Json::Value time = Collect()["System"][0]["TimeGenerated"];
  GetLocalTime(&after);
  EXPECT_THAT(time, testing::AnyOf(FormatEventTime(before), FormatEventTime(after)));
}

TEST_F(EventLogCollectorTest, FirstRecordOverThirtyDaysEndsItsLogOnly) {
  m_application.records = {Record(31 * kDay, u"old"), Record(1, u"new behind old")};
  m_system.records = {Record(1, u"new"), Record(29 * kDay, u"younger"), Record(31 * kDay), Record(1), Record(1)};
  m_system.recordsPerRead = 2;
  const Json::Value data = Collect();
  EXPECT_EQ(data["Application"], Json::Value(Json::arrayValue));
  EXPECT_THAT(Sources(data["System"]), ElementsAre("new", "younger"));
  EXPECT_EQ(m_system.records.size(), 1u) << "nothing was read behind the batch with the old record";
}

TEST_F(EventLogCollectorTest, RecordLargerThanTheBufferGrowsItOnce) {
  const std::string large = Make({Ago(1), 1, 4, u"large", u"PC", {std::u16string(60'000, u'x')}});
  m_system.records = {Record(1, u"before"), large, large, Record(1, u"behind")};
  EXPECT_THAT(Sources(Collect()["System"]), ElementsAre("before", "large", "large", "behind"));
  const auto size = static_cast<DWORD>(large.size());
  EXPECT_THAT(m_system.bufferSizes, ElementsAre(0x10000, 0x10000, size, size, size, size));
}

TEST_F(EventLogCollectorTest, BufferThatCannotGrowEndsTheLogWithWhatWasRead) {
  const std::wstring refused = L"Failed to reallocate the memory for the record buffer (";
  const std::pair<DWORD, std::wstring> rows[] = {{0x80000, refused + L"524288 bytes).\n"},
                                                 {0xFFFFFFFF, refused + L"-1 bytes).\n"},
                                                 {0x10000, L"ReadEventLog failed with 122.\n"},
                                                 {0, L"ReadEventLog failed with 122.\n"}};
  for (const auto& row : rows) {
    const DWORD needed = row.first;
    const Json::Value records = ReadScripted([needed, call = 0](char* buffer, DWORD& read, DWORD& bytesNeeded) mutable {
      const std::string record = Record(1, u"before");
      std::copy(record.begin(), record.end(), buffer);
      read = static_cast<DWORD>(record.size());
      bytesNeeded = needed;
      return ++call == 1 ? ERROR_SUCCESS : ERROR_INSUFFICIENT_BUFFER;
    });
    EXPECT_THAT(Sources(records), ElementsAre("before")) << needed;
    EXPECT_THAT(Lines(L"ReadEventLogForSource"), ElementsAre(row.second)) << needed;
  }
}

TEST_F(EventLogCollectorTest, LogThatIsRefusedIsEmptyAndTheOtherIsRead) {
  m_application.openError = ERROR_ACCESS_DENIED;
  m_system.records = {Record(1, u"system")};
  const Json::Value data = Collect();
  EXPECT_EQ(data["Application"], Json::Value(Json::arrayValue));
  EXPECT_THAT(Sources(data["System"]), ElementsAre("system"));
  EXPECT_THAT(Lines(L"ReadEventLogForSource"), ElementsAre(L"OpenEventLog failed with 0x5.\n"));
}

TEST_F(EventLogCollectorTest, LogThatChangesWhileItIsReadKeepsWhatWasRead) {
  m_application.records = {Record(2, u"first"), Record(3, u"second")};
  m_application.recordsPerRead = 1;
  m_application.beforeRead = [](FakeLogs::Log& log) {
    if (log.bufferSizes.size() == 1) log.records.push_back(Record(1, u"written meanwhile"));
  };
  m_system.records = {Record(2, u"first"), Record(3, u"cleared")};
  m_system.recordsPerRead = 1;
  m_system.beforeRead = [](FakeLogs::Log& log) {
    if (log.bufferSizes.empty()) return;
    log.records.clear();
    log.readError = ERROR_EVENTLOG_FILE_CHANGED;
  };
  const Json::Value data = Collect();
  EXPECT_THAT(Sources(data["Application"]), ElementsAre("first", "second", "written meanwhile"));
  EXPECT_THAT(Sources(data["System"]), ElementsAre("first"));
  EXPECT_THAT(Lines(L"ReadEventLogForSource"), ElementsAre(L"ReadEventLog failed with 1503.\n"));
}

TEST_F(EventLogCollectorTest, CancelIsSeenBeforeEveryRead) {
  m_application.records = {Record(1, u"one"), Record(1, u"two"), Record(1, u"three")};
  m_application.recordsPerRead = 1;
  m_application.beforeRead = [this](FakeLogs::Log& log) { m_cancel = log.records.size() == 2; };
  m_system.records = {Record(1)};
  const Json::Value data = Collect();
  EXPECT_THAT(Sources(data["Application"]), ElementsAre("one", "two"));
  EXPECT_EQ(data["System"], Json::Value(Json::arrayValue));
  EXPECT_THAT(m_system.bufferSizes, IsEmpty());
}

TEST_F(EventLogCollectorTest, DamagedRecordsAreLoggedAndDoNotHideTheOthers) {
  std::string damaged = Record(1, u"damaged");
  event_records::Put(damaged, event_records::kStringCount, uint16_t{500});
  std::string damagedAndOld = damaged;
  event_records::Put(damagedAndOld, 12, uint32_t{0});
  std::string endless = Record(1, u"endless");
  event_records::Put(endless, event_records::kLength, uint32_t{0});
  m_system.records = {damaged, damagedAndOld, Record(1, u"behind"), endless, Record(1, u"lost")};
  const Json::Value data = Collect();
  EXPECT_THAT(Sources(data["System"]), ElementsAre("damaged", "behind"));
  const std::vector<std::wstring> lines = Lines(L"DumpRecordsBatch");
  EXPECT_THAT(lines, Contains(L"The record of damaged at byte 0 of the buffer is damaged: its insertion strings lead "
                              L"out of it"));
  EXPECT_THAT(lines, Contains(AllOf(HasSubstr(L"on are lost: its length is not possible"))));
}

TEST_F(EventLogCollectorTest, ReadThatClaimsMoreThanTheBufferOrNothingDoesNoHarm) {
  for (const DWORD bytes : {DWORD{0xFFFF'FFFF}, DWORD{0x10001}, DWORD{0}}) {
    const Json::Value records = ReadScripted([bytes, call = 0](char*, DWORD& read, DWORD&) mutable {
      read = ++call == 1 ? bytes : 0;
      return ERROR_SUCCESS;
    });
    EXPECT_EQ(records.size(), 0u);
  }
}

TEST(EventLog, LogsOfThisMachineCanBeReadToTheirEnd) {
  EventLogCollector collector(L"windows_events");
  logging::ErrorCapture errors;
  collector.Start(nullptr, nullptr, nullptr);
  const Json::Value data = collector.GetData();
  EXPECT_TRUE(data["Application"].isArray());
  EXPECT_TRUE(data["System"].isArray());
  EXPECT_THAT(errors.Take(), IsEmpty());
}

}  // namespace
}  // namespace systeminfo
