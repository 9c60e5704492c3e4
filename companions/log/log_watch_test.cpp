#include <gmock/gmock.h>

#include "companions/log/log_settings.h"
#include "companions/log/log_test_library.h"
#include "tests/support/log_text.h"
#include "tests/support/test_folder.h"

namespace {

using testing::AllOf;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;

class SettingsFile : public testing::Test {
 protected:
  SettingsFile() { m_log.LogInit(); }
  ~SettingsFile() override { m_log.LogDeinit(); }

  // Saves as the program and editors do: in place.
  void Save(std::string_view xml) const {
    const KernelHandle file(CreateFileW(m_path.c_str(), GENERIC_WRITE, FILE_SHARE_READ | FILE_SHARE_WRITE, nullptr,
                                        CREATE_ALWAYS, 0, nullptr));
    DWORD written = 0;
    EXPECT_TRUE(WriteFile(file.Get(), xml.data(), static_cast<DWORD>(xml.size()), &written, nullptr));
  }
  std::string Log(const wchar_t* folder = L"logs") const { return LogText(m_folder.Path(folder) + L"\\log_test.log"); }
  // Waits up to 10 seconds for the watcher.
  template <class Condition>
  static bool Becomes(Condition condition) {
    for (int i = 0; i < 500 && !condition(); ++i)
      Sleep(20);
    return condition();
  }

  TestFolder m_folder;
  const std::wstring m_path = m_folder.Path(L"Logger.xml");
  LogLibrary m_log;
};

TEST_F(SettingsFile, EnvironmentVariablesAndRelativeFoldersAreResolved) {
  SetEnvironmentVariableW(L"ST_LOG_TEST", L"of the environment");
  Save("<configuration path='%ST_LOG_TEST%/deeper'><level>ERROR</level></configuration>");
  m_log.LogSetSettingsFile(m_path.c_str());
  EXPECT_EQ(m_log.LogGetLevel(), 63u);  // nothing is read yet
  EXPECT_EQ(m_log.LogApplySettings(), 0);
  EXPECT_EQ(m_log.LogGetLevel(), 4u);
  m_log.Write(LOG_LEVEL_ERROR, L"a");
  EXPECT_THAT(Log(L"of the environment\\deeper"), EndsWith("a\r\n"));
}

TEST_F(SettingsFile, AMissingOrBrokenFileLeavesTheSettingsInForce) {
  m_log.LogSetPath(m_folder.Path(L"logs").c_str());
  m_log.LogSetLevel(LOG_LEVEL_ERROR | LOG_LEVEL_WARNING);
  m_log.LogSetSettingsFile(m_path.c_str());
  EXPECT_EQ(m_log.LogApplySettings(), ERROR_FILE_NOT_FOUND);
  Save("<configuration><level>");
  EXPECT_EQ(m_log.LogApplySettings(), ERROR_INVALID_DATA);
  EXPECT_EQ(m_log.LogGetLevel(), 12u);
  EXPECT_THAT(Lines(Log()),
              ElementsAre(HasSubstr("settings in force stay: error 2"), HasSubstr("settings in force stay: not XML")));
}

TEST_F(SettingsFile, ChangesAreAppliedWhileTheProgramRuns) {
  Save("<configuration path='logs'><level>ERROR</level></configuration>");
  m_log.LogSetSettingsFile(m_path.c_str());
  m_log.LogApplySettings();
  EXPECT_EQ(m_log.LogMonitorSettings(1), 0);
  Save("<configuration path='elsewhere'><level>WARNING | ERROR</level></configuration>");
  EXPECT_TRUE(Becomes([this] { return m_log.LogGetLevel() == 12; }));

  // Half a file, and nothing more for a while: one warning, and what was in force stays.
  Save("<configuration path='elsewhere'><level>INFO</lev");
  EXPECT_TRUE(Becomes([this] { return !Log(L"elsewhere").empty(); }));
  m_folder.MakeFile(L"another file of the folder");  // wakes the watcher without a change of the settings
  Sleep(1000);                                       // longer than the watcher's patience with a broken file
  EXPECT_EQ(m_log.LogGetLevel(), 12u);
  EXPECT_THAT(Lines(Log(L"elsewhere")),
              ElementsAre(AllOf(HasSubstr(" WARNING "), HasSubstr("Logger.xml cannot be used"))));

  Save("<configuration path='elsewhere'><level>TRACE</level></configuration>");
  EXPECT_TRUE(Becomes([this] { return m_log.LogGetLevel() == 32; }));
  EXPECT_EQ(m_log.LogMonitorSettings(0), 0);
  Save("<configuration path='elsewhere'><level>FATAL</level></configuration>");
  Sleep(400);
  EXPECT_EQ(m_log.LogGetLevel(), 32u);
}

TEST_F(SettingsFile, AReplacedFileAndANewlyNamedOneAreNoticed) {
  Save("<configuration path='logs'><level>ERROR</level></configuration>");
  m_log.LogSetSettingsFile(m_path.c_str());
  m_log.LogApplySettings();
  m_log.LogMonitorSettings(1);
  m_folder.MakeFile(L"Logger.xml", "<configuration path='logs'><level>FATAL</level></configuration>");  // by renaming
  EXPECT_TRUE(Becomes([this] { return m_log.LogGetLevel() == 1; }));

  const std::wstring other = m_folder.Path(L"later\\Logger.xml");  // not even its folder is there
  m_log.LogSetSettingsFile(other.c_str());
  m_folder.MakeFile(L"later\\Logger.xml", "<configuration path='logs'><level>INFO</level></configuration>");
  EXPECT_TRUE(Becomes([this] { return m_log.LogGetLevel() == 16; }));
}

TEST(ShippedSettings, SayWhatTheDefaultsAre) {
  const logfile::ParsedSettings parsed = logfile::ParseSettings(LogText(ProgramFolder() + L"\\Logger.xml"));
  EXPECT_THAT(parsed.problems, testing::IsEmpty());
  EXPECT_EQ(parsed.settings, logfile::Settings());
}

// A library that watches is asked to go without LogDeinit: the watching thread keeps the code it runs in.
TEST(LoadedLibrary, FreedWithoutDeinitItStaysAsLongAsItWatches) {
  const TestFolder folder;
  const std::wstring settings = folder.MakeFile(L"Logger.xml", "<configuration path='logs'/>");
  auto log = std::make_unique<LogLibrary>();
  log->LogInit();
  log->LogSetSettingsFile(settings.c_str());
  log->LogMonitorSettings(1);
  Sleep(50);
  log.reset();
  EXPECT_NE(GetModuleHandleW(L"log.dll"), nullptr);
  log = std::make_unique<LogLibrary>();
  EXPECT_EQ(log->LogDeinit(), 0);
  log.reset();
  EXPECT_EQ(GetModuleHandleW(L"log.dll"), nullptr);
}

}  // namespace
