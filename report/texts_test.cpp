#include <gmock/gmock.h>

#include "report/findings_output.h"
#include "report/json_access.h"
#include "report/times.h"
#include "report/windows_text.h"

namespace report {
namespace {

using testing::Optional;

TEST(Times, BothFormsAreRead) {
  EXPECT_THAT(TimeFromIso("1970-01-02T00:00:01Z"), Optional(86401.0));
  EXPECT_THAT(TimeFromEvent("3/4/2024 09:05:07"), Optional(1709543107.0));
}

TEST(Times, OtherTextsAreNoTimes) {
  for (const char* text : {"", "Z", "2024-03-04T12:00:00", "2024-13-04T12:00:00Z", "2024-02-30T12:00:00Z",
                           "2024-03-04T24:00:00Z", "2024-03-04T12:00Z", "2024-03-04T12:00:00ZZ",
                           "99999-01-01T00:00:00Z", "2024-03--4T12:00:00Z", "2024-03-04 12:00:00Z"}) {
    EXPECT_EQ(TimeFromIso(text), std::nullopt) << text;
  }
  for (const char* text : {"", "13/4/2024 09:05:07", "3/4/2024", "3/4/2024 09:05:07 PM", "a/b/c d:e:f"})
    EXPECT_EQ(TimeFromEvent(text), std::nullopt) << text;
}

TEST(WindowsText, TheProgramOfACommandLine) {
  const std::pair<const char*, const char*> rows[] = {
      {"\"C:\\A b\\c.exe\" -x", "C:\\A b\\c.exe"},
      {"C:\\A b\\c.EXE -x", "C:\\A b\\c.EXE"},
      {"C:\\a.exe.d\\b.exe", "C:\\a.exe.d\\b.exe"},
      {"\\??\\C:\\x.sys", "C:\\x.sys"},
      {"rundll32 x.dll,Run", "rundll32 x.dll"},
      {"tool /s", "tool"},
      {"\"C:\\open", "C:\\open"},
      {"", ""},
  };
  for (const auto& [line, program] : rows)
    EXPECT_EQ(ProgramOf(line), program) << line;
}

TEST(WindowsText, PathsAreComparedByWholeComponents) {
  EXPECT_TRUE(LiesBelow("C:\\Program Files\\Q\\", "c:\\program files\\q\\a.exe"));
  EXPECT_FALSE(LiesBelow("C:\\Q", "C:\\Qx\\a.exe"));
  EXPECT_FALSE(LiesBelow("C:\\Q", "C:\\Q\\"));
  EXPECT_FALSE(LiesBelow("", "C:\\Q"));
  EXPECT_TRUE(LiesInTemporaryFolder("C:/Users/a/AppData/Local/Temp/x.exe"));
  EXPECT_FALSE(LiesInTemporaryFolder("C:\\temp.exe"));
}

TEST(JsonAccess, NumbersComeAsNumbersAndAsText) {
  EXPECT_THAT(NumberOf(Json::Value("18014398509481984")), Optional(18014398509481984.0));
  EXPECT_THAT(NumberOf(Json::Value(-2.5)), Optional(-2.5));
  for (const Json::Value& value : {Json::Value("1x"), Json::Value(""), Json::Value("99999999999999999999"),
                                   Json::Value(true), Json::Value(), Json::Value(Json::arrayValue)}) {
    EXPECT_EQ(NumberOf(value), std::nullopt) << value.toStyledString();
  }
}

TEST(FindingsOutput, NothingInATextSteersTheTerminal) {
  EXPECT_EQ(Printable("a\x1B[31m\nb\x7F\xC2\x9B\xE2\x80\xAE"
                      "c"),
            "a?[31m?b???c");
  EXPECT_EQ(Printable("\xC3\xB6\xE6\x9D\xB1"), "\xC3\xB6\xE6\x9D\xB1");
}

}  // namespace
}  // namespace report
