#include "monitoring/sample_file.h"

#include <gmock/gmock.h>

#include "core/logging.h"
#include "tests/support/log_text.h"
#include "tests/support/test_folder.h"

namespace st::monitoring {
namespace {

constexpr SYSTEMTIME kTime{2026, 1, 0, 2, 3, 4, 5, 6};

TEST(SampleLine, IsAnIsoTimeAndAValueThatReadsBack) {
  EXPECT_EQ(SampleLine(kTime, 12.5), "2026-01-02T03:04:05.006Z,12.5\r\n");
  EXPECT_EQ(SampleLine(kTime, 0.1), "2026-01-02T03:04:05.006Z,0.1\r\n");
  EXPECT_EQ(SampleLine(kTime, -1.7976931348623157e308), "2026-01-02T03:04:05.006Z,-1.7976931348623157e+308\r\n");
}

TEST(SampleFile, GoesOnWithAnOlderFile) {
  const TestFolder folder;
  const std::wstring path = folder.Path(L"c.csv");
  for (const double value : {1.5, 2.0}) {
    SampleFile file(path, 1000);
    file.Append(kTime, value);
  }
  EXPECT_EQ(LogText(path), "time,value\r\n2026-01-02T03:04:05.006Z,1.5\r\n2026-01-02T03:04:05.006Z,2\r\n");
}

TEST(SampleFile, NeverGrowsBeyondItsLimit) {
  logging::ErrorCapture lines(logging::Level::kWarning);
  const TestFolder folder;
  const std::wstring path = folder.Path(L"c.csv");
  const size_t limit = std::string_view("time,value\r\n").size() + SampleLine(kTime, 1).size();
  {
    SampleFile file(path, limit);
    for (int i = 0; i < 10; ++i)
      file.Append(kTime, 1);
  }
  EXPECT_EQ(LogText(path).size(), limit);
  EXPECT_EQ(lines.Take().size(), 1U);
  SampleFile(path, limit - 1).Append(kTime, 1);
  SampleFile(folder.Path(L"d.csv"), 3).Append(kTime, 1);
  EXPECT_EQ(LogText(path).size(), limit);
  EXPECT_EQ(LogText(folder.Path(L"d.csv")), "");
}

TEST(SampleFile, WhatCannotBeOpenedIsLoggedOnce) {
  const TestFolder folder;
  SampleFile other(folder.Path(L"c.csv"), 1000);
  other.Append(kTime, 1);
  for (const std::wstring& path :
       {folder.MakeFolder(L"a folder"), folder.Path(L"absent\\c.csv"), folder.Path(L"C.csv")}) {
    logging::ErrorCapture errors;
    SampleFile file(path, 1000);
    file.Append(kTime, 1);
    file.Append(kTime, 2);
    EXPECT_EQ(errors.Take().size(), 1U) << path;
  }
  EXPECT_EQ(Lines(LogText(folder.Path(L"c.csv"))).size(), 2U);
}

}  // namespace
}  // namespace st::monitoring
