#include <gmock/gmock.h>

#include <thread>
#include <vector>

#include "companions/log/log_test_library.h"
#include "tests/support/log_text.h"
#include "tests/support/test_folder.h"

namespace {

using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::SizeIs;

class Library : public testing::Test {
 protected:
  Library() {
    m_log.LogInit();
    m_log.LogSetPath(m_folder.Path(L"deep\\logs").c_str());
  }
  ~Library() override { m_log.LogDeinit(); }

  std::wstring File(const wchar_t* name) const { return m_folder.Path(std::wstring(L"deep\\logs\\") + name); }
  std::vector<std::string> LogLines(const wchar_t* name = L"log_test.log") const { return Lines(LogText(File(name))); }

  TestFolder m_folder;
  LogLibrary m_log;
};

TEST_F(Library, ALineHasAllItsParts) {
  const LogRecord record{LOG_LEVEL_WARNING};
  m_log.LogWrite(0, &record, GetModuleHandleW(nullptr), L"st::F", L"%s %S %d \x00E4\xD83D\xDE42", L"wide", "narrow",
                 -7);
  ASSERT_THAT(LogLines(), SizeIs(1));
  const std::string expected = " WARNING  " + std::to_string(GetCurrentProcessId()) + ":" +
                               std::to_string(GetCurrentThreadId()) +
                               " log_test.exe [st::F] wide narrow -7 \xC3\xA4\xF0\x9F\x99\x82";
  EXPECT_EQ(LogLines()[0].substr(23), expected);
}

TEST_F(Library, NullArgumentsAreWrittenAsTraceLinesAndTheLastErrorStays) {
  SetLastError(4711);
  m_log.LogWrite(0, nullptr, nullptr, nullptr, nullptr);
  m_log.LogWrite(0, nullptr, reinterpret_cast<HMODULE>(0x1234560000), L"f", L"text");
  EXPECT_EQ(GetLastError(), 4711u);
  EXPECT_THAT(LogLines(), ElementsAre(HasSubstr(" TRACE "), HasSubstr(" ? [f] text")));
}

TEST_F(Library, OnlyLevelsOfTheMaskAreWrittenAndScopesStillIndent) {
  EXPECT_EQ(m_log.LogSetLevel(LOG_LEVEL_ERROR | LOG_LEVEL_INFO), 0);
  EXPECT_EQ(m_log.LogGetLevel(), 20u);
  m_log.Write(LOG_LEVEL_TRACE, L"-> f()", +1);
  for (uint32_t level = 1; level <= 32; level *= 2)
    m_log.Write(level, std::to_wstring(level));
  m_log.Write(LOG_LEVEL_TRACE, L"<- f()", -1);
  m_log.Write(LOG_LEVEL_TRACE, L"<- one too many", -1);
  m_log.Write(LOG_LEVEL_INFO, L"end");
  EXPECT_THAT(LogLines(), ElementsAre(EndsWith("]   4"), EndsWith("]   16"), EndsWith("] end")));
}

TEST_F(Library, DisabledOrWithoutALevelNothingIsWritten) {
  EXPECT_EQ(m_log.LogIsEnabled(), 1);
  m_log.LogEnable(0);
  EXPECT_EQ(m_log.LogIsEnabled(), 0);
  m_log.Write(LOG_LEVEL_FATAL, L"a");
  m_log.LogEnable(1);
  m_log.LogSetLevel(0);
  EXPECT_EQ(m_log.LogIsEnabled(), 0);
  m_log.LogSetLevel(LOG_LEVEL_ALL);
  m_log.LogSetType(LOG_TYPE_DEBUGGER);
  m_log.Write(LOG_LEVEL_FATAL, L"b");
  EXPECT_FALSE(PathExists(File(L"")));
}

TEST_F(Library, WrongArgumentsAreRefused) {
  EXPECT_NE(m_log.LogSetLevel(64), 0);
  EXPECT_NE(m_log.LogSetDepth(2), 0);
  EXPECT_NE(m_log.LogSetType(4), 0);
  EXPECT_NE(m_log.LogSetMode(2), 0);
  EXPECT_NE(m_log.LogSetPath(nullptr), 0);
  EXPECT_NE(m_log.LogSetSettingsFile(L""), 0);
  EXPECT_NE(m_log.LogTrackEvent(nullptr, L"b"), 0);
  EXPECT_NE(m_log.LogTrackEventData(L"a", L"b", nullptr), 0);
  EXPECT_NE(m_log.LogApplySettings(), 0);  // no settings file was named
  EXPECT_NE(m_log.LogMonitorSettings(1), 0);
}

TEST_F(Library, CallsOfInitAndDeinitAreCounted) {
  EXPECT_EQ(m_log.LogInit(), 0);
  EXPECT_EQ(m_log.LogDeinit(), 0);
  EXPECT_EQ(m_log.LogIsEnabled(), 1);
  EXPECT_EQ(m_log.LogDeinit(), 0);
  EXPECT_EQ(m_log.LogIsEnabled(), 0);
  m_log.Write(LOG_LEVEL_FATAL, L"nowhere");
  EXPECT_NE(m_log.LogDeinit(), 0);
  EXPECT_EQ(m_log.LogInit(), 0);
  EXPECT_FALSE(PathExists(File(L"")));
}

TEST_F(Library, AFullFileIsMovedAsideAndOnlySoManyAreKept) {
  m_log.LogSetMaxSize(1000);
  for (int i = 0; i < 100; ++i)
    m_log.Write(LOG_LEVEL_INFO, std::to_wstring(i) + std::wstring(200, L'x'));
  // Three lines of about 270 bytes fit.
  const auto first = [this](const wchar_t* name) {
    const std::string text = LogText(File(name));
    EXPECT_LE(text.size(), 1000u) << name;
    return TextOf(text).substr(0, 2);
  };
  EXPECT_EQ(first(L"log_test.log"), "99");
  EXPECT_EQ(first(L"log_test.1.log"), "96");
  EXPECT_EQ(first(L"log_test.5.log"), "84");
  EXPECT_FALSE(PathExists(File(L"log_test.6.log")));
}

TEST_F(Library, AFullFileThatAViewerHoldsIsWrittenOnAndMovedLater) {
  m_log.LogSetMaxSize(100);
  m_log.Write(LOG_LEVEL_INFO, L"1");
  KernelHandle viewer(CreateFileW(File(L"log_test.log").c_str(), GENERIC_READ, FILE_SHARE_READ | FILE_SHARE_WRITE,
                                  nullptr, OPEN_EXISTING, 0, nullptr));
  ASSERT_TRUE(viewer);
  for (int i = 2; i <= 5; ++i)
    m_log.Write(LOG_LEVEL_INFO, std::to_wstring(i));
  EXPECT_THAT(LogLines(), SizeIs(5));
  viewer.Reset();
  m_log.Write(LOG_LEVEL_INFO, std::wstring(70000, L'x'));
  m_log.Write(LOG_LEVEL_INFO, L"7");
  EXPECT_THAT(LogLines(L"log_test.1.log"), SizeIs(6));
  EXPECT_THAT(LogLines(), SizeIs(1));
}

TEST_F(Library, OverwriteMovesTheFileOfTheLastRunAsideOnce) {
  m_folder.MakeFile(L"deep\\logs\\log_test.log", "the last run\r\n");
  m_log.LogSetMode(LOG_MODE_OVERWRITE);
  m_log.Write(LOG_LEVEL_INFO, L"a");
  m_log.LogSetPath(m_folder.Path(L"elsewhere").c_str());
  m_log.Write(LOG_LEVEL_INFO, L"b");
  m_log.LogSetPath(m_folder.Path(L"deep\\logs").c_str());
  m_log.Write(LOG_LEVEL_INFO, L"c");
  EXPECT_EQ(LogText(File(L"log_test.1.log")), "the last run\r\n");
  EXPECT_THAT(LogLines(), ElementsAre(EndsWith("a"), EndsWith("c")));
}

TEST_F(Library, ATornLineOfAnEarlierRunIsEndedFirst) {
  m_folder.MakeFile(L"deep\\logs\\log_test.log", "2026-01-01 torn by a power cu");
  m_log.Write(LOG_LEVEL_INFO, L"a");
  EXPECT_THAT(LogLines(), ElementsAre("2026-01-01 torn by a power cu", EndsWith("] a")));
}

TEST_F(Library, EachModuleHasItsFileWhenAsked) {
  const HMODULE kernel = GetModuleHandleW(L"kernel32.dll");
  m_log.Write(LOG_LEVEL_INFO, L"together", 0, kernel);
  m_log.LogSetDepth(LOG_DEPTH_MODULE);
  m_log.Write(LOG_LEVEL_INFO, L"apart", 0, kernel);
  m_log.Write(LOG_LEVEL_INFO, L"program");
  EXPECT_THAT(LogLines(), ElementsAre(EndsWith(" kernel32.dll [test::Function] together"), EndsWith("program")));
  EXPECT_THAT(LogLines(L"log_test.kernel32.log"), ElementsAre(EndsWith("apart")));
  // While it is open nobody can delete it; a module that is gone lets go.
  EXPECT_FALSE(DeleteFileW(File(L"log_test.kernel32.log").c_str()));
  EXPECT_EQ(m_log.LogRemoveModule(kernel), 0);
  EXPECT_TRUE(DeleteFileW(File(L"log_test.kernel32.log").c_str()));
}

TEST_F(Library, EventsAreCountedUntilTheirCountsAreWritten) {
  for (int i = 0; i < 3; ++i)
    m_log.LogTrackEvent(L"page", L"submit");
  m_log.LogTrackEventData(L"page", L"language", L"ro");
  m_log.LogUninitDeskMetrics();
  m_log.LogUninitDeskMetrics();
  EXPECT_THAT(LogLines(),
              ElementsAre(EndsWith("event page/language: ro"), EndsWith("event page/language happened 1 times"),
                          EndsWith("event page/submit happened 3 times")));
}

TEST_F(Library, ThreadsWriteWholeLinesInTheOrderOfTheirTimes) {
  m_log.LogSetMaxSize(100000);  // rotation goes on below them
  std::vector<std::thread> threads;
  threads.reserve(8);
  for (int t = 0; t < 8; ++t) {
    threads.emplace_back([this, t] {
      for (int i = 0; i < 500; ++i)
        m_log.Write(LOG_LEVEL_INFO, std::to_wstring(t) + L"." + std::to_wstring(i) + L" end");
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  std::vector<int> next(8, 0);
  std::string lastTime;
  for (const wchar_t* name : {L"log_test.5.log", L"log_test.4.log", L"log_test.3.log", L"log_test.2.log",
                              L"log_test.1.log", L"log_test.log"}) {
    for (const std::string& line : LogLines(name)) {
      int thread = 0;
      int number = 0;
      ASSERT_EQ(std::sscanf(TextOf(line).c_str(), "%d.%d end", &thread, &number), 2) << line;
      EXPECT_EQ(number, next[static_cast<size_t>(thread)]++) << line;
      EXPECT_LE(lastTime, line.substr(0, 23));
      lastTime = line.substr(0, 23);
    }
  }
  EXPECT_THAT(next, testing::Each(500));
}

// The folder cannot be made, because a file has its name; then it can.
TEST_F(Library, LinesThatCannotBeWrittenAreCountedAndTheCountIsWritten) {
  const std::wstring obstacle = m_folder.MakeFile(L"deep", "");
  for (int i = 0; i < 3; ++i)
    m_log.Write(LOG_LEVEL_INFO, L"lost");
  ASSERT_TRUE(DeleteFileW(obstacle.c_str()));
  for (int i = 0; i < 100 && LogLines().empty(); ++i) {
    Sleep(50);
    m_log.Write(LOG_LEVEL_INFO, L"again");
  }
  const std::vector<std::string> lines = LogLines();
  ASSERT_THAT(lines, SizeIs(2));
  EXPECT_THAT(lines[0], HasSubstr(" WARNING "));
  EXPECT_THAT(lines[0], HasSubstr(" lines could not be written and are missing here: error "));
  EXPECT_THAT(lines[1], EndsWith("again"));
}

TEST(LoadedLibrary, CanBeFreedWhileThreadsThatLoggedGoOn) {
  const TestFolder folder;
  const KernelHandle logged(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  const KernelHandle freed(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  auto log = std::make_unique<LogLibrary>();
  log->LogInit();
  log->LogSetPath(folder.Path().c_str());
  std::thread thread([&] {
    log->Write(LOG_LEVEL_INFO, L"in", +1);
    SetEvent(logged.Get());
    WaitForSingleObject(freed.Get(), INFINITE);
  });
  WaitForSingleObject(logged.Get(), INFINITE);
  log->LogDeinit();
  log.reset();
  EXPECT_EQ(GetModuleHandleW(L"log.dll"), nullptr);
  SetEvent(freed.Get());
  thread.join();
  EXPECT_THAT(Lines(LogText(folder.Path(L"log_test.log"))), SizeIs(1));
}

}  // namespace
