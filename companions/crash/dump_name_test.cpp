#include "companions/crash/dump_name.h"

#include <gtest/gtest.h>

TEST(DumpName, NamesProgramProcessAndTime) {
  crash::DumpPath path(L"D:\\dumps", L"support_tool.exe", 4294967295u);
  path.SetTime({2031, 1, 2, 3, 4, 5});
  EXPECT_STREQ(path.Path(), L"D:\\dumps\\support_tool_4294967295_20310102-030405.dmp");
  EXPECT_STREQ(path.PartialPath(), L"D:\\dumps\\support_tool_4294967295_20310102-030405.dmp.partial");
  path.SetTime({2031, 12, 31, 23, 59, 59});
  EXPECT_STREQ(path.Path(), L"D:\\dumps\\support_tool_4294967295_20311231-235959.dmp");
}

TEST(DumpName, APlainDumpIsNamedAsOneAndRecognised) {
  crash::DumpPath path(L"D:", L"support_tool.EXE", 1, L"_plain");
  path.SetTime({2031, 1, 2, 3, 4, 5});
  EXPECT_STREQ(path.Path(), L"D:\\support_tool_plain_1_20310102-030405.dmp");
  EXPECT_TRUE(crash::IsDumpName(path.Path() + 3));
}

TEST(DumpName, AVeryLongProgramNameStillFitsAFileName) {
  crash::DumpPath path(L"", std::wstring(251, L'n') + L".exe", 4294967295u);
  path.SetTime({2031, 1, 2, 3, 4, 5});
  EXPECT_LE(std::wstring(path.PartialPath()).size(), 255u);
  EXPECT_TRUE(crash::IsDumpName(path.Path() + 1));
}

TEST(DumpName, OnlyOwnNamesAreRecognised) {
  const struct {
    const wchar_t* name;
    bool isDump;
    bool isPartial;
  } rows[] = {
      {L"support_tool_12_20310102-030405.dmp", true, false},
      {L"a_1_20310102-030405.dmp", true, false},
      {L"a_1_20310102-030405.dmp.partial", false, true},
      {L"a_1_20310102-030405.dmp.partial.partial", false, false},
      {L"a_1_20310102-030405.txt", false, false},
      {L"a_1_20310102_030405.dmp", false, false},
      {L"a_1_2031010x-030405.dmp", false, false},
      {L"a__20310102-030405.dmp", false, false},
      {L"a_x_20310102-030405.dmp", false, false},
      {L"_1_20310102-030405.dmp", false, false},
      {L"1_20310102-030405.dmp", false, false},
      {L"_20310102-030405.dmp", false, false},
      {L"20310102-030405.dmp", false, false},
      {L"notepad_1234.dmp", false, false},
      {L".dmp", false, false},
      {L"", false, false},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(crash::IsDumpName(row.name), row.isDump) << row.name;
    EXPECT_EQ(crash::IsPartialDumpName(row.name), row.isPartial) << row.name;
  }
}
