#include <gmock/gmock.h>

#include "core/logging.h"

namespace logging {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

TEST(ErrorCapture, NestedCapturesEachGetTheLinesOfTheirLevel) {
  ErrorCapture everything(Level::kTrace);
  {
    ErrorCapture errors;
    LOG_TRACE(L"a", L"one");
    LOG_ERROR(L"b", L"two %d", 2);
    EXPECT_THAT(errors.Take(), ElementsAre(L"b: two 2"));
  }
  LOG_FATAL(L"c", L"three");
  EXPECT_THAT(everything.Take(), ElementsAre(L"a: one", L"b: two 2", L"c: three"));
  EXPECT_THAT(everything.Take(), IsEmpty());
}

TEST(ErrorCapture, DroppedLinesAreCounted) {
  ErrorCapture errors;
  for (size_t i = 0; i < ErrorCapture::kMostLines + 3; ++i)
    LOG_ERROR(L"f", L"%u", static_cast<unsigned>(i));
  const std::vector<std::wstring> lines = errors.Take();
  ASSERT_EQ(lines.size(), ErrorCapture::kMostLines + 1);
  EXPECT_EQ(lines[ErrorCapture::kMostLines - 1], L"f: 199");
  EXPECT_EQ(lines.back(), L"(3 more lines)");
}

TEST(ErrorCapture, LinesOfAThreadBehindAClosedGateAreNobodys) {
  ErrorCapture errors;
  std::atomic<bool> isClosed{false};
  const auto logTwice = [&] {
    {
      const CaptureGate gate(isClosed);
      LOG_ERROR(L"f", L"behind a gate");
    }
    LOG_ERROR(L"f", L"without one");
  };
  logTwice();
  EXPECT_THAT(errors.Take(), ElementsAre(L"f: behind a gate", L"f: without one"));
  isClosed = true;
  logTwice();
  EXPECT_THAT(errors.Take(), ElementsAre(L"f: without one"));
}

}  // namespace
}  // namespace logging
