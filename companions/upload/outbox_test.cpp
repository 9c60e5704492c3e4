#include "companions/upload/outbox.h"

#include <gtest/gtest.h>

#include "core/files.h"

namespace {

using qxlink::OutboxFileName;
using qxlink::ResolveOutboxFolder;

TEST(OutboxFileName, HasTimeRandomDigitsAndTheOriginalName) {
  SYSTEMTIME time{};
  time.wYear = 2026;
  time.wMonth = 1;
  time.wDay = 2;
  time.wHour = 3;
  time.wMinute = 4;
  time.wSecond = 5;
  const std::wstring longName = L"C:\\" + std::wstring(300, L'n') + L".zip";
  struct {
    std::wstring path;
    std::wstring name;
  } const rows[] = {
      {L"C:\\data\\collected.zip", L"collected.zip"},
      {L"collected \u00e4.zip", L"collected \u00e4.zip"},
      {L"C:/data/a.zip", L"a.zip"},
      {L"C:\\data\\a:b*?\x01.zip", L"a_b___.zip"},
      {L"C:\\data\\dots. . .", L"dots"},
      {L"...", L"upload"},
      {longName, std::wstring(196, L'n') + L".zip"},
      // The cut would go through a character of two units.
      {L"\U0001F600" + std::wstring(199, L'n'), std::wstring(199, L'n')},
  };
  for (const auto& row : rows) {
    EXPECT_EQ(OutboxFileName(time, 0xAB, row.path), L"20260102-030405-00000000000000ab-" + row.name) << row.path;
  }
}

TEST(ResolveOutboxFolder, ExpandsVariablesAndBeginsAtTheLibrary) {
  SetEnvironmentVariableW(L"ST_TEST_OUTBOX", L"D:\\Mail \u00e4");
  SetEnvironmentVariableW(L"ST_TEST_NOTHING", nullptr);
  struct {
    const wchar_t* configured;
    const wchar_t* folder;
  } const rows[] = {
      {L"%ST_TEST_OUTBOX%\\out", L"\\\\?\\D:\\Mail \u00e4\\out"},
      {L"E:\\out", L"\\\\?\\E:\\out"},
      {L"\\\\server\\share\\out", L"\\\\?\\UNC\\server\\share\\out"},
      {L"out", L"\\\\?\\C:\\Tool\\out"},
      {L"..\\out/box", L"\\\\?\\C:\\out\\box"},
      {L"100% mail", L"\\\\?\\C:\\Tool\\100% mail"},
      {L"%ST_TEST_NOTHING%\\out", L""},
  };
  for (const auto& row : rows)
    EXPECT_EQ(ResolveOutboxFolder(row.configured, L"C:\\Tool"), row.folder);
}

}  // namespace
