#include "companions/events/beat.h"

#include <gtest/gtest.h>

#include <limits>

TEST(NextDue, StaysOnTheBeatAndLeavesOutWhatWasMissed) {
  struct {
    const char* what;
    int64_t due;
    int64_t period;
    int64_t now;
    int64_t expected;
  } const rows[] = {
      {"in time", 100, 10, 100, 110},
      {"a little late", 100, 10, 109, 110},
      {"the timer came early", 100, 10, 97, 110},
      {"just as the next beat comes, which is missed", 100, 10, 110, 120},
      {"one beat missed", 100, 10, 111, 120},
      {"many missed", 100, 10, 1999, 2000},
      {"on a beat after many missed", 100, 10, 2000, 2010},
      {"shortest period", 5, 1, 5, 6},
      {"longest period, after a year", 0, std::numeric_limits<int32_t>::max() * 10'000LL, 315'360'000'000'000,
       std::numeric_limits<int32_t>::max() * 150'000LL},
  };
  for (const auto& row : rows)
    EXPECT_EQ(events::NextDue(row.due, row.period, row.now), row.expected) << row.what;
}
