#include "companions/crash/crash_settings.h"

#include <gtest/gtest.h>

#include "core/files.h"
#include "core/program_path.h"

namespace {

constexpr char kDefaultPath[] = "%LOCALAPPDATA%\\Quorvex\\SupportTool\\Dumps";

std::string Document(const std::string& elements) {
  return "<?xml version=\"1.0\"?><settings><qxreinit>" + elements + "</qxreinit></settings>";
}

}  // namespace

TEST(CrashSettings, BadValuesKeepTheirDefaultAndAreReported) {
  const struct {
    std::string xml;
    std::string path;
    uint32_t count;
    size_t problems;
  } rows[] = {
      {Document("<DumpPath>D:\\dumps</DumpPath><DumpCount>7</DumpCount>"), "D:\\dumps", 7, 0},
      {Document("<DumpPath>\n  D:\\my dumps\n</DumpPath>"), "D:\\my dumps", 5, 0},
      {Document("<DumpPath>a &amp; b</DumpPath>"), "a & b", 5, 0},
      {Document("<Other/><DumpCount> 1000 </DumpCount>"), kDefaultPath, 1000, 0},
      {Document(""), kDefaultPath, 5, 0},
      {Document("<DumpPath/>"), kDefaultPath, 5, 1},
      {Document("<DumpPath> </DumpPath><DumpCount/>"), kDefaultPath, 5, 2},
      {Document("<DumpCount>0</DumpCount>"), kDefaultPath, 5, 1},
      {Document("<DumpCount>1001</DumpCount>"), kDefaultPath, 5, 1},
      {Document("<DumpCount>-1</DumpCount>"), kDefaultPath, 5, 1},
      {Document("<DumpCount>5.5</DumpCount>"), kDefaultPath, 5, 1},
      {Document("<DumpCount>99999999999999999999</DumpCount>"), kDefaultPath, 5, 1},
      {Document("<DumpPath>x</DumpPath><DumpCount>many</DumpCount>"), "x", 5, 1},
      {"<settings><DumpPath>x</DumpPath></settings>", kDefaultPath, 5, 1},
      {"<other/>", kDefaultPath, 5, 1},
      {"", kDefaultPath, 5, 1},
      {"no XML at all", kDefaultPath, 5, 1},
      {"<settings><qxreinit><DumpPath>x", kDefaultPath, 5, 1},
      {std::string("\0\0\0\0", 4), kDefaultPath, 5, 1},
  };
  for (const auto& row : rows) {
    const crash::ParsedSettings parsed = crash::ParseSettings(row.xml);
    EXPECT_EQ(parsed.settings.dumpPath, row.path) << row.xml;
    EXPECT_EQ(parsed.settings.dumpCount, row.count) << row.xml;
    EXPECT_EQ(parsed.problems.size(), row.problems) << row.xml;
  }
}

TEST(CrashSettings, TheFileThatShipsSaysTheDefaults) {
  std::string xml;
  ASSERT_EQ(ReadWholeFile(ProgramFolder() + L"\\qxch.xml", 1 << 16, xml), 0u);
  EXPECT_NE(xml.find("<DumpPath>"), std::string::npos);
  EXPECT_NE(xml.find("<DumpCount>"), std::string::npos);
  const crash::ParsedSettings parsed = crash::ParseSettings(xml);
  EXPECT_EQ(parsed.settings.dumpPath, crash::Settings().dumpPath);
  EXPECT_EQ(parsed.settings.dumpCount, crash::Settings().dumpCount);
  EXPECT_TRUE(parsed.problems.empty());
}
