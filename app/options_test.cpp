#include "app/options.h"

#include <gtest/gtest.h>

#include <fstream>
#include <iterator>

#include "core/text.h"

namespace {

ArgumentMap Parse(const std::vector<const wchar_t*>& elements) {
  return ParseCommandLine(static_cast<int>(elements.size()), elements.data());
}

}  // namespace

TEST(ReadSwitch, LaterTestsOverrideEarlierOnesInAnyOrderOnTheCommandLine) {
  struct {
    std::vector<const wchar_t*> elements;
    bool before;
    bool expected;
  } const rows[] = {
      {{}, true, true},
      {{}, false, false},
      {{L"deleteArchive"}, false, true},
      {{L"deleteArchive=false"}, false, true},
      {{L"nodeleteArchive"}, true, false},
      {{L"da"}, false, true},
      {{L"noda"}, true, false},
      {{L"nodeleteArchive", L"deleteArchive"}, true, false},
      {{L"nodeleteArchive", L"da"}, true, true},
      {{L"deleteArchive", L"noda"}, true, false},
      {{L"noda", L"deleteArchive"}, true, false},
      {{L"da", L"noda"}, true, false},
      {{L"NODA", L"DA"}, true, true},
  };
  for (const auto& row : rows) {
    bool field = row.before;
    ReadSwitch(Parse(row.elements), options::kDeleteArchive, field);
    EXPECT_EQ(field, row.expected) << (row.elements.empty() ? L"" : row.elements[0]);
  }
}

TEST(ReadText, ShortNameWinsAndAPresentNameWithoutAValueEmpties) {
  struct {
    std::vector<const wchar_t*> elements;
    const wchar_t* expected;
  } const rows[] = {
      {{}, L"before"},      {{L"settings=a"}, L"a"}, {{L"s=b", L"settings=a"}, L"b"}, {{L"settings=a", L"s"}, L""},
      {{L"settings"}, L""},
  };
  for (const auto& row : rows) {
    std::wstring field = L"before";
    ReadText(Parse(row.elements), options::kSettings, field);
    EXPECT_EQ(field, row.expected);
  }
}

TEST(SelectMode, NonInteractiveBeatsMonitoringBeatsTheWindow) {
  struct {
    std::vector<const wchar_t*> elements;
    Mode expected;
  } const rows[] = {
      {{}, Mode::kGui},
      {{L"C:\\support_tool.exe"}, Mode::kGui},
      {{L"collect"}, Mode::kGui},
      {{L"--nogui"}, Mode::kNoGui},
      {{L"/silent", L"/c"}, Mode::kNoGui},
      {{L"NoGui"}, Mode::kGui},
      {{L"m"}, Mode::kMonitoring},
      {{L"-monitoring"}, Mode::kMonitoring},
      {{L"monitoring", L"nogui"}, Mode::kNoGui},
      {{L""}, Mode::kGui},
  };
  for (const auto& row : rows)
    EXPECT_EQ(SelectMode(Parse(row.elements)), row.expected);
}

TEST(CommandLineWarnings, NameTheNearestKnownOption) {
  struct {
    const wchar_t* element;
    const wchar_t* expected;  // what the warning ends with; empty: no warning
  } const rows[] = {
      {L"nogui", L""},
      {L"--c", L""},
      {L"-nodtf", L""},
      {L"/nocloudSubmit", L""},
      {L"pk=key.pem", L""},
      {L"", L""},
      {L"NoGui", L"'nogui'"},
      {L"--encript", L"'encrypt'"},
      {L"--nocompres", L"'nocompress'"},
      {L"colect", L"'collect'"},
      {L"--outt=x", L"'out'"},
      {L"prettyprint", L"'prettyPrint'"},
      {L"--dft", L"'dtf'"},
      {L"=v", L"it has no name"},
      {L"o=a\nb", L"its value has a line break"},
      {L"--encrypt=false", L"option 'encrypt' takes no value; 'false' is ignored"},
  };
  for (const auto& row : rows) {
    const std::vector<std::wstring> warnings = CommandLineWarnings(1, &row.element);
    if (*row.expected == L'\0') {
      EXPECT_TRUE(warnings.empty()) << warnings[0];
    } else {
      ASSERT_EQ(warnings.size(), 1u) << row.element;
      EXPECT_TRUE(warnings[0].ends_with(row.expected)) << warnings[0];
    }
  }
}

TEST(CommandLineWarnings, LongAndRepeatedNamesMakeOneShortLine) {
  const std::wstring element = L"--" + std::wstring(30000, L'x');
  const wchar_t* const elements[] = {element.c_str(), element.c_str()};
  const std::vector<std::wstring> warnings = CommandLineWarnings(2, elements);
  ASSERT_EQ(warnings.size(), 1u);
  EXPECT_LT(warnings[0].size(), 200u);
}

// The table of the documentation is that of the program.
TEST(Options, EveryOptionIsDocumentedAsItIs) {
  std::ifstream file(ST_SOURCE_DIR "/docs/command_line.md", std::ios::binary);
  const std::string document{std::istreambuf_iterator<char>(file), {}};
  for (const Option& option : options::kAll) {
    std::wstring row = std::wstring(L"| `") + option.name + L"` |";
    if (*option.shortName != L'\0') row += std::wstring(L" `") + option.shortName + L"`";
    row += L" | ";
    if (option.kind == OptionKind::kSwitch)
      row += std::wstring(L"`no") + option.name + L"`, `no" + option.shortName + L"`";
    if (option.kind == OptionKind::kText) row += std::wstring(L"`") + option.name + L"=...`";
    row += std::wstring(L" | ") + option.help + L" |";
    EXPECT_NE(document.find(ToUtf8(row)), std::string::npos) << ToUtf8(row);
  }
}
