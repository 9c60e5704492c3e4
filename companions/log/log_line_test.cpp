#include "companions/log/log_line.h"

#include <gtest/gtest.h>

#include "companions/log/dropped_lines.h"
#include "interfaces/log_constants.h"

namespace logfile {
namespace {

constexpr LocalTime kTime{2026, 3, 1, 7, 8, 9, 12};

std::string Formatted(std::string_view text, std::string_view function = "a::B", unsigned depth = 0) {
  return FormatLine({kTime, LOG_LEVEL_ERROR, 4711, 815, "tool.exe", function, text, depth});
}

TEST(FormatLine, OneRecordIsRecognisableWhateverItsText) {
  const std::string head = "2026-03-01 07:08:09.012 ERROR    4711:815 tool.exe [a::B] ";
  struct {
    std::string_view text;
    std::string expected;
  } const rows[] = {
      {"plain", "plain\r\n"},
      {"", "\r\n"},
      {"ends in one\r\n\n", "ends in one\r\n"},
      {"one\ntwo\r\n\rfour", "one\r\n    | two\r\n    | \r\n    | four\r\n"},
      {"a\xE2\x80\xA8"
       "b\xC2\x85"
       "c",
       "a\r\n    | b\r\n    | c\r\n"},
      {"x\n2026-03-01 07:08:09.012 FATAL", "x\r\n    | 2026-03-01 07:08:09.012 FATAL\r\n"},
      {std::string_view("tab\tnul\0esc\x1B", 12), "tab\tnul\\x00esc\\x1B\r\n"},
      {"\xC3\xA4\xE6\x97\xA5\xF0\x9F\x99\x82", "\xC3\xA4\xE6\x97\xA5\xF0\x9F\x99\x82\r\n"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(Formatted(row.text), head + row.expected);
}

TEST(FormatLine, NamesCannotBreakTheLine) {
  EXPECT_EQ(Formatted("t", "f\r\ng"), "2026-03-01 07:08:09.012 ERROR    4711:815 tool.exe [f g] t\r\n");
}

TEST(FormatLine, DeepScopesStopMovingRight) {
  EXPECT_EQ(Formatted("t", "f", 2).substr(51), "[f]     t\r\n");
  EXPECT_EQ(Formatted("t", "f", 1000000).size(), Formatted("t", "f").size() + size_t{kIndentWidth} * kMostIndents);
}

TEST(FormatLine, AnEndlessTextIsCutBetweenCharactersAndSaysSo) {
  const std::string line = Formatted(std::string(kLongestText - 1, 'x') + "\xC3\xA4z");
  EXPECT_TRUE(line.ends_with("x (3 more bytes)\r\n")) << line.substr(line.size() - 40);
}

TEST(EffectiveLevel, TheGravestKnownBitElseTrace) {
  EXPECT_EQ(EffectiveLevel(LOG_LEVEL_INFO), uint32_t{LOG_LEVEL_INFO});
  EXPECT_EQ(EffectiveLevel(LOG_LEVEL_INFO | LOG_LEVEL_ERROR), uint32_t{LOG_LEVEL_ERROR});
  EXPECT_EQ(EffectiveLevel(0), uint32_t{LOG_LEVEL_TRACE});
  EXPECT_EQ(EffectiveLevel(0x40000000), uint32_t{LOG_LEVEL_TRACE});
}

TEST(ApplyStep, EntryAndExitStandInOneColumnAndNothingFallsBelowZero) {
  struct {
    unsigned depth;
    int step;
    unsigned ofLine, after;
  } const rows[] = {
      {0, 0, 0, 0},  {0, +1, 0, 1},     {3, +1, 3, 4},       {4, -1, 3, 3},
      {0, -1, 0, 0}, {2, -32768, 0, 0}, {~0u, +1, ~0u, ~0u}, {~0u - 1, 32767, ~0u - 1, ~0u},
  };
  for (const auto& row : rows) {
    const Indent indent = ApplyStep(row.depth, row.step);
    EXPECT_EQ(indent.ofLine, row.ofLine) << row.depth << " " << row.step;
    EXPECT_EQ(indent.after, row.after) << row.depth << " " << row.step;
  }
}

TEST(LogFileName, SlotModuleAndNumber) {
  EXPECT_EQ(LogFileName(L"tool", 1, L"", 0), L"tool.log");
  EXPECT_EQ(LogFileName(L"tool", 1, L"", 3), L"tool.3.log");
  EXPECT_EQ(LogFileName(L"tool", 2, L"", 3), L"tool-2.3.log");
  EXPECT_EQ(LogFileName(L"tool", 2, L"engine", 3), L"tool-2.engine.3.log");
  EXPECT_EQ(LogFileName(L"tool", 1, L"3", 0), L"tool.module3.log");  // not the old file 3
}

TEST(PlanRotation, MovesUpToTheFirstFreeNumber) {
  using Plan = std::vector<Renaming>;
  EXPECT_EQ(PlanRotation({}), Plan());
  EXPECT_EQ(PlanRotation({false, false, true}), (Plan{{0, 1}}));
  EXPECT_EQ(PlanRotation({true, false, true}), (Plan{{1, 2}, {0, 1}}));
  EXPECT_EQ(PlanRotation({true, true}), (Plan{{1, 2}, {0, 1}}));
}

TEST(IsFull, BothSidesOfTheLimit) {
  EXPECT_FALSE(IsFull(60, 40, 100));
  EXPECT_TRUE(IsFull(60, 41, 100));
  EXPECT_FALSE(IsFull(0, 1000, 100));  // a record that is longer than any file
  EXPECT_TRUE(IsFull(200, ~uint64_t{0}, 100));
  EXPECT_FALSE(IsFull(~uint64_t{0}, 1, 0));
}

TEST(DroppedLines, TheFirstLineThatCanBeWrittenAgainSaysHowManyAreMissing) {
  std::string disk;
  uint32_t error = 0;
  DroppedLines dropped;
  const auto write = [&](std::string_view line) {
    dropped.Write(
        line,
        [&](std::string_view bytes) {
          if (error == 0) disk += bytes;
          return error;
        },
        [](uint64_t count, uint32_t why) { return "(" + std::to_string(count) + " for " + std::to_string(why) + ")"; });
  };
  write("a");
  error = 112;  // disk full
  write("b");
  error = 5;
  write("c");
  write("d");
  error = 0;
  write("e");
  write("f");
  EXPECT_EQ(disk, "a(3 for 112)ef");
}

}  // namespace
}  // namespace logfile
