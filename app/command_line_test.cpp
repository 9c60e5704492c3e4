#include "app/command_line.h"

#include <gtest/gtest.h>

TEST(SplitArgument, MatchesWholeElementsAsTheExpressionDoes) {
  struct {
    const wchar_t* element;
    const wchar_t* name;
    const wchar_t* value;
  } const rows[] = {
      {L"collect", L"collect", L""},
      {L"--collect", L"collect", L""},
      {L"-collect", L"collect", L""},
      {L"/collect", L"collect", L""},
      {L"---x", L"-x", L""},
      {L"/-x", L"-x", L""},
      {L"-/x", L"/x", L""},
      {L"//x", L"/x", L""},
      {L"", L"", L""},
      {L"-", L"", L""},
      {L"--", L"", L""},
      {L"=v", L"", L"v"},
      {L"--=v", L"", L"v"},
      {L"-o=C:\\a b\\c", L"o", L"C:\\a b\\c"},
      {L"settings=a=b==c", L"settings", L"a=b==c"},
      {L"settings=", L"settings", L""},
      {L"--x=--y", L"x", L"--y"},
      {L"Z:\\a\\support_tool.exe", L"Z:\\a\\support_tool.exe", L""},
      {L"two\nlines", L"two\nlines", L""},
  };
  for (const auto& row : rows) {
    const auto argument = SplitArgument(row.element);
    ASSERT_TRUE(argument) << row.element;
    EXPECT_EQ(argument->name, row.name) << row.element;
    EXPECT_EQ(argument->value, row.value) << row.element;
  }
}

TEST(SplitArgument, LineBreakInTheValueIsNoMatch) {
  for (const wchar_t* element : {L"-o=a\nb", L"o=\r", L"o=x\u2028", L"=\u2029y"})
    EXPECT_FALSE(SplitArgument(element));
}

TEST(SplitArgument, VeryLongElementsPass) {
  const std::wstring value(30000, L'=');
  const std::wstring element = L"--" + std::wstring(30000, L'n') + L"=" + value;
  EXPECT_EQ(SplitArgument(element)->value, value);
}

TEST(ParseCommandLine, RepeatedNamesKeepEveryValueAndLookupsTakeTheFirst) {
  const wchar_t* const elements[] = {L"--out=first", L"-out=second", L"/out", L"Out=other case", L"bad=a\nb"};
  const ArgumentMap arguments = ParseCommandLine(5, elements);
  EXPECT_EQ(arguments, (ArgumentMap{{L"out", {L"first", L"second", L""}}, {L"Out", {L"other case"}}}));
  EXPECT_EQ(GetArgument(arguments, L"out"), L"first");
  EXPECT_EQ(GetArgument(arguments, L"OUT"), L"");
  EXPECT_FALSE(HasArgument(arguments, L"OUT"));
}
