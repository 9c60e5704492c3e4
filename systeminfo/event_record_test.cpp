#include "systeminfo/event_record.h"

#include <gmock/gmock.h>

#include <memory>
#include <random>

#include "tests/support/event_records.h"

namespace systeminfo {
namespace {

using event_records::Fields;
using event_records::kFixedSize;
using event_records::kLength;
using event_records::kStringCount;
using event_records::kStringOffset;
using event_records::Make;
using event_records::Put;
using testing::ElementsAre;
using testing::IsEmpty;

const Fields kFirst{1'709'543'107, 0xC0001000, 2, u"Quelle", u"RECHNER", {u"one", u"", u"\u6771\U0001F600"}};

// Copies the bytes into memory of exactly their size, so that a read outside meets the allocator's own words at least,
// and counts what the reader makes of them.
struct Walk {
  explicit Walk(std::string_view bytes) {
    const auto exact = std::make_unique<char[]>(bytes.size());
    std::copy(bytes.begin(), bytes.end(), exact.get());
    EventRecordReader reader({exact.get(), bytes.size()});
    EventRecord record;
    while (reader.Next(record)) {
      ++records;
      if (reader.Damage() != nullptr) damages.emplace_back(reader.Damage());
      last = record;
    }
    if (reader.Damage() != nullptr) damages.emplace_back(reader.Damage());
    EXPECT_FALSE(reader.Next(record)) << "after the end";
  }
  size_t records = 0;
  std::vector<std::string> damages;
  EventRecord last;
};

TEST(EventRecordReader, RecordsComeOneAfterAnotherWithAllTheirFields) {
  const std::string bytes = Make(kFirst) + Make({5, 6, 7, u"", u"", {}});
  EventRecordReader reader(bytes);
  EventRecord record;
  ASSERT_TRUE(reader.Next(record));
  EXPECT_EQ(record.timeGenerated, 1'709'543'107u);
  EXPECT_EQ(record.eventId, 0xC0001000u);
  EXPECT_EQ(record.eventType, 2);
  EXPECT_EQ(record.sourceName, "Quelle");
  EXPECT_EQ(record.computerName, "RECHNER");
  EXPECT_THAT(record.insertionStrings, ElementsAre("one", "", "\xE6\x9D\xB1\xF0\x9F\x98\x80"));
  EXPECT_EQ(reader.Damage(), nullptr);

  ASSERT_TRUE(reader.Next(record));
  EXPECT_EQ(reader.Offset(), Make(kFirst).size());
  EXPECT_EQ(record.timeGenerated, 5u);
  EXPECT_EQ(record.sourceName, "");
  EXPECT_THAT(record.insertionStrings, IsEmpty());
  EXPECT_FALSE(reader.Next(record));
  EXPECT_EQ(reader.Damage(), nullptr);
}

TEST(EventRecordReader, HalfASurrogatePairBecomesTheReplacementCharacter) {
  const std::u16string high(1, 0xD83D);
  const std::u16string low(1, 0xDE00);
  EXPECT_THAT(
      Walk(Make({0, 0, 0, u"s", u"c", {high, low + u"x", high + u"x", high + high + low}})).last.insertionStrings,
      ElementsAre("\xEF\xBF\xBD", "\xEF\xBF\xBDx", "\xEF\xBF\xBDx", "\xEF\xBF\xBD\xF0\x9F\x98\x80"));
}

TEST(EventRecordReader, ImpossibleLengthEndsTheBuffer) {
  const std::string good = Make(kFirst);
  for (const uint32_t length : {0u, 1u, 55u, static_cast<uint32_t>(good.size() + 1), 0x80000000u, 0xFFFFFFFFu}) {
    std::string bad = good;
    Put(bad, kLength, length);
    const Walk walk(good + bad);
    EXPECT_EQ(walk.records, 1u) << length;
    EXPECT_THAT(walk.damages, ElementsAre("its length is not possible")) << length;
  }
  for (size_t size = 1; size < kFixedSize; ++size)
    EXPECT_THAT(Walk(good.substr(0, size)).damages, ElementsAre("the buffer ends within it")) << size;
  EXPECT_THAT(Walk({}).damages, IsEmpty());
}

TEST(EventRecordReader, WhatIsSoundInADamagedRecordIsKeptAndTheNextOneFollows) {
  const std::string good = Make(kFirst);
  const auto end = static_cast<uint32_t>(good.size());
  const struct {
    uint32_t offset;
    uint16_t count;
    size_t strings;  // that can be read
  } rows[] = {{end, 3, 0},          {end - 1, 1, 0}, {end + 1, 1, 0},   {0xFFFFFFFF, 1, 0}, {0xFFFFFFFE, 0xFFFF, 0},
              {end - 2, 0xFFFF, 1}, {0, 0xFFFF, 20}, {0x80000000, 2, 0}};
  for (const auto& row : rows) {
    std::string bad = good;
    Put(bad, kStringOffset, row.offset);
    Put(bad, kStringCount, row.count);
    const Walk walk(good + bad);
    EXPECT_EQ(walk.records, 2u) << row.offset;
    EXPECT_THAT(walk.damages, ElementsAre("its insertion strings lead out of it")) << row.offset;
    EXPECT_EQ(walk.last.sourceName, "Quelle") << row.offset;
    EXPECT_GE(walk.last.insertionStrings.size(), row.strings) << row.offset;
    EXPECT_EQ(Walk(bad + good).last.insertionStrings.size(), 3u) << row.offset;
  }
  std::string unused = Make({0, 0, 0, u"s", u"c", {}});
  Put(unused, kStringOffset, 0xFFFFFFFF);
  EXPECT_THAT(Walk(unused).damages, IsEmpty()) << "no strings, so their offset means nothing";
}

TEST(EventRecordReader, NamesThatDoNotEndAreLeftOut) {
  std::string bytes(kFixedSize + 8, 'x');
  Put(bytes, kLength, static_cast<uint32_t>(bytes.size()));
  EXPECT_THAT(Walk(bytes).damages, ElementsAre("its source name does not end"));
  EXPECT_EQ(Walk(bytes).last.sourceName, "");
  Put(bytes, kFixedSize + 4, uint16_t{0});
  EXPECT_THAT(Walk(bytes).damages, ElementsAre("its computer name does not end"));
  EXPECT_EQ(Walk(bytes).last.sourceName, "\xE7\xA1\xB8\xE7\xA1\xB8");
  Put(bytes, kLength, static_cast<uint32_t>(kFixedSize));
  EXPECT_THAT(Walk(bytes.substr(0, kFixedSize)).damages, ElementsAre("its source name does not end"));
}

TEST(EventRecordReader, RandomMutationsNeverLeadOutsideTheBuffer) {
  std::mt19937 random(7);
  const auto below = [&random](size_t limit) { return random() % limit; };
  const std::string good = Make(kFirst) + Make({5, 6, 7, u"Another", u"PC", {u"a", u"b"}}) + Make(kFirst);
  size_t damaged = 0;
  for (int round = 0; round < 20'000; ++round) {
    std::string bytes = good;
    for (size_t changes = 1 + below(4); changes > 0; --changes) {
      const size_t offset = below(3) == 0 ? below(kFixedSize) : below(bytes.size());
      bytes[offset] = static_cast<char>(below(3) == 0 ? 0xFF : below(256));
    }
    if (below(3) == 0) bytes.resize(below(bytes.size() + 1));
    const Walk walk(bytes);
    damaged += walk.damages.empty() ? 0 : 1;
    ASSERT_LE(walk.records, good.size() / kFixedSize) << round;
  }
  EXPECT_GT(damaged, 5'000u);
}

TEST(IsTooOld, ThirtyDaysAreKeptAndNotASecondMore) {
  constexpr int64_t kNow = 1'709'543'107;
  EXPECT_FALSE(IsTooOld(kNow, static_cast<uint32_t>(kNow - 2'592'000)));
  EXPECT_TRUE(IsTooOld(kNow, static_cast<uint32_t>(kNow - 2'592'001)));
  EXPECT_FALSE(IsTooOld(kNow, 0xFFFFFFFF)) << "a clock that was ahead";
  EXPECT_TRUE(IsTooOld(kNow, 0));
}

}  // namespace
}  // namespace systeminfo
