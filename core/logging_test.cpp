// The facade, the scope trace and the configuration need a process of their own, with or without a library beside it.
#include <gmock/gmock.h>

#include "core/files.h"
#include "core/logger_config.h"
#include "core/program_path.h"
#include "tests/support/child_process.h"
#include "tests/support/log_text.h"
#include "tests/support/test_folder.h"

namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::MatchesRegex;

// A folder with a program in it, "tool.exe", and what lies beside it.
class Logging : public testing::Test {
 protected:
  Logging() { CopyToFolder(L"log_child.exe", L"tool.exe"); }

  void CopyToFolder(const std::wstring& name, const std::wstring& as) const {
    const std::wstring source = ProgramFolder() + L"\\" + name;
    ASSERT_TRUE(CopyFileW(source.c_str(), m_folder.Path(as).c_str(), FALSE)) << GetLastError();
  }
  std::string Run(const std::wstring& arguments) const {
    ChildProcess child(L"\"" + m_folder.Path(L"tool.exe") + L"\" " + arguments);
    std::string output = child.ReadAll();
    EXPECT_EQ(child.Wait(), 0u);
    return output;
  }
  std::string Log() const { return LogText(m_folder.Path(L"logs\\tool.log")); }

  TestFolder m_folder;
};

TEST_F(Logging, WithoutTheLibraryNothingIsWrittenAndNoArgumentEvaluated) {
  m_folder.MakeFile(L"Logger.xml", "<configuration path='logs'/>");
  EXPECT_EQ(Run(L"facade"), "bound 0, configured 1, enabled 0, evaluated 0\n");
  EXPECT_FALSE(PathExists(m_folder.Path(L"logs")));
}

TEST_F(Logging, AFileThatIsNoLibraryIsAsGoodAsNone) {
  m_folder.MakeFile(L"log.dll", "this is no library");
  EXPECT_EQ(Run(L"facade"), "bound 0, configured 0, enabled 0, evaluated 0\n");
}

TEST_F(Logging, ALibraryThatExportsOnlyWritingIsUsedForThat) {
  CopyToFolder(L"log_partial.dll", L"log.dll");
  m_folder.MakeFile(L"Logger.xml", "<configuration path='logs'/>");
  const std::string output = Run(L"facade");
  EXPECT_THAT(output, HasSubstr("0 4 child: an error, evaluation 1\n"));
  EXPECT_THAT(output, HasSubstr("bound 1, configured 1, enabled 1, evaluated 1\n"));
}

TEST_F(Logging, TheConfigurationOfTheProgramsNameWins) {
  CopyToFolder(L"log.dll", L"log.dll");
  m_folder.MakeFile(L"Logger.xml", "<configuration path='of the folder'/>");
  m_folder.MakeFile(L"tool.logger.xml", "<configuration path='logs'/>");
  Run(L"facade");
  EXPECT_FALSE(PathExists(m_folder.Path(L"of the folder")));
  std::vector<std::string> texts;
  for (const std::string& line : Lines(Log()))
    texts.push_back(line.substr(line.find('[')));
  EXPECT_THAT(texts, ElementsAre(MatchesRegex(R"(\[logging::LoggerConfig::Init\] Configured by .*\\tool\.logger\.xml)"),
                                 MatchesRegex(R"(\[logging::LoggerConfig::Init\] Log folder is .*\\logs)"),
                                 "[child] an error, evaluation 1"));
}

TEST_F(Logging, AConfigurationThatCannotBeReadIsReportedByTheResult) {
  CopyToFolder(L"log_partial.dll", L"log.dll");
  for (const char* text : {"", "<configuration", "<other/>"}) {
    m_folder.MakeFile(L"Logger.xml", text);
    EXPECT_THAT(Run(L"facade"), HasSubstr("bound 1, configured 0,")) << text;
  }
}

TEST_F(Logging, ScopesNestAndEndByExceptionsToo) {
  CopyToFolder(L"log.dll", L"log.dll");
  m_folder.MakeFile(L"Logger.xml", "<configuration path='logs'/>");
  Run(L"scopes");
  std::vector<std::string> texts;
  for (const std::string& line : Lines(Log()))
    texts.push_back(TextOf(line));
  ASSERT_EQ(texts.size(), 10u);
  EXPECT_EQ(texts[2], "-> Outer()");
  EXPECT_EQ(texts[3], "  -> Inner()");
  EXPECT_EQ(texts[4], "    before the exception");
  EXPECT_THAT(texts[5], MatchesRegex(R"(  <- Inner\(\) \[\d+\])"));
  EXPECT_EQ(texts[6], "  after the exception");
  EXPECT_EQ(texts[7], "  -> " + std::string(260, 'x'));  // cut, the "()" with it
  EXPECT_THAT(texts[8], HasSubstr("<- " + std::string(260, 'x') + " ["));
  EXPECT_THAT(texts[9], MatchesRegex(R"(<- Outer\(\) \[\d+\])"));
}

TEST(ProgramLoggerPath, OnlyTheExtensionIsReplaced) {
  EXPECT_EQ(logging::ProgramLoggerPath(L"C:\\a.b\\tool.exe"), L"C:\\a.b\\tool.logger.xml");
  EXPECT_EQ(logging::ProgramLoggerPath(L"C:\\a.b\\tool"), L"C:\\a.b\\tool.logger.xml");
  EXPECT_EQ(logging::ProgramLoggerPath(L"C:\\a.b\\two.dots.exe"), L"C:\\a.b\\two.dots.logger.xml");
}

}  // namespace
