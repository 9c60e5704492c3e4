#include "companions/log/log_settings.h"

#include <gmock/gmock.h>

namespace logfile {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

TEST(ParseLevels, NamesJoinedByBars) {
  struct {
    const char* text;
    std::optional<uint32_t> expected;
  } const rows[] = {
      {"FATAL | CRITICAL | ERROR | WARNING | INFO | TRACE", 63},
      {"FATAL | CRITICAL | ERROR | WARNING", 15},
      {"error|trace", 36},
      {"\n  Warning\t", 8},
      {"ALL", 63},
      {"NONE", 0},
      {"", std::nullopt},
      {"ERROR |", std::nullopt},
      {"ERROR | BOGUS", std::nullopt},
      {"ERROR WARNING", std::nullopt},
      {"15", std::nullopt},
  };
  for (const auto& row : rows)
    EXPECT_EQ(ParseLevels(row.text), row.expected) << row.text;
}

TEST(ParseSize, BytesAndUnits) {
  struct {
    const char* text;
    std::optional<uint64_t> expected;
  } const rows[] = {
      {"0", 0},
      {" 4096 ", 4096},
      {"10 MB", 10485760},
      {"3kb", 3072},
      {"7 B", 7},
      {"17179869183GB", 17179869183ull << 30},
      {"17179869184GB", std::nullopt},         // 2^64
      {"18446744073709551616", std::nullopt},  // 2^64
      {"-1", std::nullopt},
      {"1.5 MB", std::nullopt},
      {"10 TB", std::nullopt},
      {"MB", std::nullopt},
      {"", std::nullopt},
  };
  for (const auto& row : rows)
    EXPECT_EQ(ParseSize(row.text), row.expected) << row.text;
}

TEST(ParseSettings, EveryElementTakesEffect) {
  const ParsedSettings parsed = ParseSettings(R"(<?xml version="1.0"?>
    <configuration path=" D:\logs "><!-- c --><enabled>false</enabled><level>ERROR</level><depth>MODULE</depth>
      <type>file | debugger</type><mode>OVERWRITE</mode><maxSize>2 KB</maxSize><oldFiles>9</oldFiles></configuration>)");
  ASSERT_TRUE(parsed.settings);
  EXPECT_THAT(parsed.problems, IsEmpty());
  EXPECT_EQ(parsed.settings->folder, "D:\\logs");
  EXPECT_FALSE(parsed.settings->enabled);
  EXPECT_EQ(parsed.settings->levels, uint32_t{LOG_LEVEL_ERROR});
  EXPECT_EQ(parsed.settings->depth, uint32_t{LOG_DEPTH_MODULE});
  EXPECT_EQ(parsed.settings->types, uint32_t{LOG_TYPE_FILE | LOG_TYPE_DEBUGGER});
  EXPECT_EQ(parsed.settings->mode, uint32_t{LOG_MODE_OVERWRITE});
  EXPECT_EQ(parsed.settings->maxBytes, 2048u);
  EXPECT_EQ(parsed.settings->oldFiles, 9u);
}

TEST(ParseSettings, ThePathIsAnAttributeElseAChild) {
  struct {
    const char* xml;
    const char* expected;
  } const rows[] = {
      {"<configuration path='a'><path>b</path></configuration>", "a"},
      {"<configuration path='  '><path> b\n</path></configuration>", "b"},
      {"<configuration><path/></configuration>", logging::kDefaultLogFolder},
      {"<configuration/>", logging::kDefaultLogFolder},
  };
  for (const auto& row : rows)
    EXPECT_EQ(ParseSettings(row.xml).settings.value().folder, row.expected) << row.xml;
}

TEST(ParseSettings, AValueThatIsNotUnderstoodIsNamedAndDefaulted) {
  const ParsedSettings parsed = ParseSettings(
      "<configuration><level>LOUD</level><oldFiles>100</oldFiles><depth/><maxSise>1</maxSise>"
      "<mode>OVERWRITE</mode></configuration>");
  ASSERT_TRUE(parsed.settings);
  EXPECT_THAT(parsed.problems, ElementsAre(HasSubstr("\"LOUD\" is not a value of \"level\""), HasSubstr("\"oldFiles\""),
                                           HasSubstr("\"depth\""), HasSubstr("no setting \"maxSise\"")));
  EXPECT_EQ(parsed.settings->levels, uint32_t{LOG_LEVEL_ALL});
  EXPECT_EQ(parsed.settings->oldFiles, 5u);
  EXPECT_EQ(parsed.settings->mode, uint32_t{LOG_MODE_OVERWRITE});
}

TEST(ParseSettings, WhatIsNoConfigurationGivesNone) {
  const std::string deep = std::string("<configuration>") + [] {
    std::string nested;
    for (int i = 0; i < 100000; ++i)
      nested += "<a>";
    return nested;
  }();
  for (const std::string& xml :
       {std::string(), std::string("<configuration"), std::string("<configuration><level>ERROR</configuration>"),
        std::string("<logger/>"), std::string("\0\0\0", 3), deep}) {
    const ParsedSettings parsed = ParseSettings(xml);
    EXPECT_FALSE(parsed.settings) << xml.substr(0, 50);
    EXPECT_EQ(parsed.problems.size(), 1u) << xml.substr(0, 50);
  }
}

}  // namespace
}  // namespace logfile
