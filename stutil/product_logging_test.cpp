#include "stutil/product_logging.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "core/files.h"
#include "core/program_path.h"
#include "interfaces/crash_handler_api.h"
#include "stutil/logger_xml.h"
#include "stutil/raised_logging.h"
#include "tests/support/child_process.h"
#include "tests/support/control_block_user.h"
#include "tests/support/test_folder.h"

namespace {

using stutil::LoggerLevels;
using stutil::ProductLogging;
using stutil::RaisedLogging;
using testing::ElementsAre;
using testing::HasSubstr;

// Not laid out as the XML library would.
constexpr char kLoggerXml[] =
    "<?xml version=\"1.0\" encoding='utf-8'?>\r\n<!-- of the maker -->\r\n<configuration path='logs'>\r\n"
    "\t<depth>EXE</depth>\r\n  <level>ERROR</level><maxSize>1 MB</maxSize>\r\n\r\n</configuration>\r\n";
constexpr char kFull[] = "FATAL | CRITICAL | ERROR | WARNING | INFO | TRACE";

std::string Read(const std::wstring& path) {
  std::string bytes;
  ReadWholeFile(path, 1 << 20, bytes);
  return bytes;
}

LoggerLevels LevelsOf(const std::wstring& path) {
  const auto settings = stutil::ReadLoggerXml(Read(path));
  return settings ? settings->levels : LoggerLevels{};
}

class ProductLoggingTest : public testing::Test {
 protected:
  TestFolder m_folder;
  std::wstring m_file = m_folder.MakeFile(L"Logger.xml", kLoggerXml);
  ProductLogging m_logging{m_folder.Path()};
  ControlBlockUser m_product{{{"scanner", 1}, {"updater", 0}, {"a name that fills its field to the end", 7}}};
};

}  // namespace

TEST_F(ProductLoggingTest, ActivatingRaisesTheRegisteredComponentsAndTheFile) {
  EXPECT_TRUE(m_logging.Activate());
  EXPECT_THAT(m_product.Levels(4), ElementsAre(2, 2, 2, 0));
  EXPECT_EQ(LevelsOf(m_file), (LoggerLevels{"MODULE", kFull}));
  EXPECT_THAT(Read(m_file), HasSubstr("<!-- of the maker -->"));
  EXPECT_THAT(Read(m_file), HasSubstr("<maxSize>1 MB</maxSize>"));
}

TEST_F(ProductLoggingTest, DisablingPutsBackExactlyWhatWasThere) {
  m_logging.Activate();
  m_logging.Activate();  // a second time keeps what the first one found
  m_product.Register({"late", 2});
  EXPECT_TRUE(m_logging.Disable());
  EXPECT_THAT(m_product.Levels(4), ElementsAre(1, 0, 7, 0));
  EXPECT_EQ(Read(m_file), kLoggerXml);
  EXPECT_FALSE(PathExists(m_logging.MarkerPath()));
}

TEST_F(ProductLoggingTest, DisablingWithoutHavingActivatedWritesTheDescribedValues) {
  EXPECT_TRUE(m_logging.Disable());
  EXPECT_THAT(m_product.Levels(3), ElementsAre(0, 0, 0));
  EXPECT_EQ(LevelsOf(m_file), (LoggerLevels{"EXE", "FATAL | CRITICAL | ERROR | WARNING"}));
}

TEST_F(ProductLoggingTest, WhatSomebodyElseChangedMeanwhileStays) {
  m_logging.Activate();
  std::string edited = Read(m_file);
  edited.replace(edited.find("1 MB"), 4, "9 MB");
  m_folder.MakeFile(L"Logger.xml", edited);
  EXPECT_TRUE(m_logging.Disable());
  EXPECT_EQ(LevelsOf(m_file), (LoggerLevels{"EXE", "ERROR"}));
  EXPECT_THAT(Read(m_file), HasSubstr("<maxSize>9 MB</maxSize>"));
}

TEST_F(ProductLoggingTest, MissingElementsAreMissingAgainAfterwards) {
  m_folder.MakeFile(L"Logger.xml", "<configuration/>");
  EXPECT_TRUE(m_logging.Activate());
  EXPECT_EQ(LevelsOf(m_file), (LoggerLevels{"MODULE", kFull}));
  EXPECT_TRUE(m_logging.Disable());
  EXPECT_EQ(Read(m_file), "<configuration/>");
}

TEST_F(ProductLoggingTest, OneHalfIsDoneWhenTheOtherFails) {
  for (const char* text : {"", "no XML", "<other/>", "<configuration><depth></configuration>"}) {
    m_folder.MakeFile(L"Logger.xml", text);
    EXPECT_FALSE(m_logging.Activate()) << text;
    EXPECT_THAT(m_product.Levels(3), ElementsAre(2, 2, 2)) << text;
    EXPECT_EQ(Read(m_file), text);
    m_logging.Disable();
    EXPECT_THAT(m_product.Levels(3), ElementsAre(1, 0, 7)) << text;
    EXPECT_EQ(Read(m_file), text);
  }
  DeleteFileW(m_file.c_str());
  EXPECT_FALSE(m_logging.Activate());
  EXPECT_FALSE(m_logging.Disable());
  EXPECT_THAT(m_product.Levels(3), ElementsAre(1, 0, 7));
  EXPECT_FALSE(PathExists(m_file));
  EXPECT_FALSE(PathExists(m_logging.MarkerPath()));
}

TEST_F(ProductLoggingTest, AFileThatCannotBeReadIsLeftAlone) {
  const std::string before = Read(m_file);
  {
    const KernelHandle held(CreateFileW(m_file.c_str(), GENERIC_READ, 0, nullptr, OPEN_EXISTING, 0, nullptr));
    EXPECT_FALSE(m_logging.Activate());
  }
  EXPECT_THAT(m_product.Levels(3), ElementsAre(2, 2, 2));
  EXPECT_EQ(Read(m_file), before);
}

TEST_F(ProductLoggingTest, BlockThatClaimsMoreComponentsThanItHoldsIsChangedToItsEndOnly) {
  m_product.Block().componentCount = 0xFFFFFFFF;
  EXPECT_TRUE(m_logging.Activate());
  EXPECT_EQ(m_product.Levels(256), std::vector<uint32_t>(256, 2));
  m_product.Block().componentCount = 3;
  m_logging.Disable();
}

TEST_F(ProductLoggingTest, RaisedLoggingIsPutBackHoweverTheProcessEnds) {
  const struct {
    const wchar_t* end;
    bool isLeftRaised;
    DWORD exitCode;
  } cases[] = {{L"end", false, 0},
               {L"crash", false, EXCEPTION_ACCESS_VIOLATION},  // the crash handler has had its turn
               {L"abort", false, CRASH_CODE_ABORT},
               {L"wait", true, 1}};
  for (const auto& one : cases) {
    SCOPED_TRACE(testing::PrintToString(std::wstring(one.end)));
    {
      ChildProcess child(L"\"" + ProgramFolder() + L"\\raised_logging_child.exe\" \"" + m_folder.Path() + L"\" " +
                         one.end);
      EXPECT_EQ(child.ReadLine(), "1");
      if (one.isLeftRaised) child.Kill();
      EXPECT_EQ(child.Wait(), one.exitCode);
    }
    EXPECT_EQ(PathExists(m_logging.MarkerPath()), one.isLeftRaised);
    EXPECT_TRUE(m_logging.Restore());  // as the next start does
    EXPECT_THAT(m_product.Levels(3), ElementsAre(1, 0, 7));
    EXPECT_EQ(Read(m_file), kLoggerXml);
    EXPECT_FALSE(PathExists(m_logging.MarkerPath()));
  }
}

TEST_F(ProductLoggingTest, DamagedMarkerEndsWithTheDescribedValues) {
  for (const char* marker : {"", "\n", "[]\n", "{\"components\":[{\"name\":1}]}\n",
                             "{\"components\":[],\"logger_xml_bytes\":99}\n<configuration/>"}) {
    m_logging.Activate();
    m_folder.MakeFile(L"Logger.xml.raised", marker);
    EXPECT_TRUE(m_logging.Restore()) << marker;
    EXPECT_THAT(m_product.Levels(3), ElementsAre(0, 0, 0)) << marker;
    EXPECT_EQ(LevelsOf(m_file).depth, "EXE") << marker;
    EXPECT_FALSE(PathExists(m_logging.MarkerPath())) << marker;
  }
}

TEST_F(ProductLoggingTest, MarkerThatCannotBeReadStaysForTheNextStart) {
  m_logging.Activate();
  const std::string raised = Read(m_file);
  {
    const KernelHandle blocked(
        CreateFileW(m_logging.MarkerPath().c_str(), GENERIC_READ, 0, nullptr, OPEN_EXISTING, 0, nullptr));
    EXPECT_FALSE(m_logging.Restore());
    EXPECT_EQ(Read(m_file), raised);
  }
  EXPECT_TRUE(m_logging.Restore());
  EXPECT_EQ(Read(m_file), kLoggerXml);
}

TEST(RaisedLoggingMarker, SurvivesItsFile) {
  const RaisedLogging cases[] = {
      {{}, std::nullopt}, {{{"a", 1}, {"b", 4294967295u}}, std::string("\xFF\n\0{", 4)}, {{{"", 0}}, std::string()}};
  for (const RaisedLogging& former : cases)
    EXPECT_EQ(stutil::ReadRaisedLogging(stutil::WriteRaisedLogging(former)), former);
}
