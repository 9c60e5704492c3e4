#include "core/files.h"

#include <gtest/gtest.h>

TEST(ExtendPath, EveryKindOfPath) {
  struct {
    const wchar_t* path;
    const wchar_t* expected;
  } const rows[] = {
      {L"", L""},
      {L"C:\\a\\b", L"\\\\?\\C:\\a\\b"},
      {L"C:/a//b/", L"\\\\?\\C:\\a\\b"},
      {L"C:\\a\\.\\b\\..\\c", L"\\\\?\\C:\\a\\c"},
      {L"C:\\..\\..\\a", L"\\\\?\\C:\\a"},
      {L"C:\\", L"\\\\?\\C:\\"},
      {L"C:\\dots...", L"\\\\?\\C:\\dots..."},
      {L"collected", L"\\\\?\\D:\\work\\collected"},
      {L"..\\collected", L"\\\\?\\D:\\collected"},
      {L"\\top", L"\\\\?\\D:\\top"},
      {L"\\\\server\\share\\x", L"\\\\?\\UNC\\server\\share\\x"},
      {L"\\\\?\\C:\\kept\\..\\as it is", L"\\\\?\\C:\\kept\\..\\as it is"},
      {L"\\\\.\\pipe\\x", L"\\\\.\\pipe\\x"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(ExtendPath(row.path, L"D:\\work"), row.expected) << row.path;
}
