#include "systeminfo/utils/folder_variables.h"

#include <windows.h>

#include <gtest/gtest.h>
#include <shlobj.h>

#include "core/files.h"
#include "systeminfo/utils/registry_value.h"

namespace utils {
namespace {

std::optional<std::wstring> OneVariable(std::wstring_view name) {
  if (name == L"x") return L"<%x%>";
  return std::nullopt;
}

TEST(FolderVariables, OnlyKnownNamesBetweenTwoPercentSignsAreReplaced) {
  const struct {
    const wchar_t* text;
    const wchar_t* expected;
  } cases[] = {
      {L"", L""},
      {L"plain", L"plain"},
      {L"%x%", L"<%x%>"},  // and what comes in is not looked at again
      {L"a%x%b%x%c", L"a<%x%>b<%x%>c"},
      {L"%x%x%", L"<%x%>x%"},
      {L"100% of %x%", L"100% of <%x%>"},
      {L"%y%x%", L"%y<%x%>"},
      {L"%y%", L"%y%"},
      {L"%%", L"%%"},
      {L"%%x%%", L"%<%x%>%"},
      {L"%", L"%"},
      {L"x%", L"x%"},
      {L"%x", L"%x"},
  };
  for (const auto& row : cases)
    EXPECT_EQ(ExpandVariables(row.text, &OneVariable), row.expected) << row.text;
}

// Written out again by the meaning of each name, so that a slip in the table shows.
TEST(FolderVariables, EveryNameStandsForItsFolderInLowerCase) {
  const std::pair<const wchar_t*, int> names[] = {
      {L"programfiles", 0x26},
      {L"commonprogramfiles", 0x2B},
      {L"programfiles(x86)", 0x2A},
      {L"system", 0x25},
      {L"commonprogramfiles(x86)", 0x2C},
      {L"windir", 0x24},
      {L"system(x86)", 0x29},
      {L"appdata", 0x1A},
      {L"userprofile", 0x28},
      {L"localappdata", 0x1C},
      {L"commonappdata", 0x23},
      {L"commondesktop", 0x19},
      {L"desktop", 0x10},
      {L"commondocuments", 0x2E},
      {L"mydocuments", 0x05},
      {L"commonstartmenu", 0x16},
      {L"startmenu", 0x0B},
      {L"commonmusic", 0x35},
      {L"mymusic", 0x0D},
      {L"commonvideo", 0x37},
      {L"myvideo", 0x0E},
      {L"commonpictures", 0x36},
      {L"mypictures", 0x27},
  };
  for (const auto& [name, folder] : names) {
    wchar_t path[MAX_PATH] = {};
    ASSERT_EQ(SHGetFolderPathW(nullptr, folder, nullptr, SHGFP_TYPE_CURRENT, path), S_OK) << name;
    EXPECT_EQ(ExpandFolderVariables(L"%" + std::wstring(name) + L"%\\Sub"), LowerCase(path) + L"\\Sub") << name;
  }
}

TEST(FolderVariables, TheCaseOfANameIsIgnoredAndThatOfTheRestKept) {
  EXPECT_EQ(ExpandFolderVariables(L"A\\%WinDir%\\System32"),
            L"A\\" + ExpandFolderVariables(L"%windir%") + L"\\System32");
}

TEST(FolderVariables, OtherNamesAreEnvironmentVariables) {
  SetEnvironmentVariableW(L"ST_Test_Variable", L"Value %windir%");
  EXPECT_EQ(ExpandFolderVariables(L"<%st_test_variable%>"), L"<Value %windir%>");
  SetEnvironmentVariableW(L"ST_Test_Variable", nullptr);
  EXPECT_EQ(ExpandFolderVariables(L"<%st_test_variable%>"), L"<%st_test_variable%>");
  EXPECT_EQ(ExpandFolderVariables(L"%programData%"), ExpandEnvironment(L"%ProgramData%"));
}

TEST(FolderVariables, HugeTextAndZeroCharactersEndWell) {
  const std::wstring percents(500'000, L'%');
  EXPECT_EQ(ExpandFolderVariables(percents), percents);
  const std::wstring longName = L"%" + std::wstring(500'000, L'n') + L"%";
  EXPECT_EQ(ExpandFolderVariables(longName), longName);
  const std::wstring zero(L"%windir\0%", 9);
  EXPECT_EQ(ExpandFolderVariables(zero), zero);
}

}  // namespace
}  // namespace utils
