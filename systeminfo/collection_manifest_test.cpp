#include "systeminfo/collection_manifest.h"

#include <gmock/gmock.h>

#include "core/json.h"
#include "core/logging.h"
#include "tests/support/test_folder.h"

namespace systeminfo {
namespace {

Json::Value Parsed(std::string_view text) {
  Json::Value value;
  std::string error;
  EXPECT_TRUE(ParseJson(text, value, error)) << error;
  return value;
}

const ManifestHeader kHeader{"1.2.3", "2024-05-31T09:08:07Z", "2024-05-31T09:09:00Z", -210};

TEST(CountRecords, ArraysCountTheirElementsAndOtherValuesAreOneRecord) {
  struct {
    const char* data;
    uint64_t records;
  } const rows[] = {
      {"null", 0},
      {"[]", 0},
      {"[1,[2,3],{}]", 3},
      {"{}", 1},
      {R"({"a":1,"b":{"c":[1,2]}})", 1},
      {R"({"Application":[1,2],"System":[3],"count":7})", 3},
      {R"({"Application":[]})", 0},
      {"\"text\"", 1},
      {"0", 1},
  };
  for (const auto& row : rows)
    EXPECT_EQ(CountRecords(Parsed(row.data)), row.records) << row.data;
}

TEST(CollectionManifest, EachOutcomeIsToldApart) {
  const std::vector<CollectorOutcome> outcomes = {
      {L"storage", L"DiskCollector", Outcome::kData, L"", 3, 99, 12, {}},
      {L"network", L"NetworkCollector", Outcome::kNoData, L"", 0, 0, 1, {L"f: \u00e4"}},
      {L"services", L"ServiceCollector", Outcome::kFailed, L"bad", 0, 0, 2, {}},
      {L"printers", L"PrintersCollector", Outcome::kNotWritten, L"error 112", 5, 0, 3, {}},
  };
  EXPECT_EQ(WriteStyledJson(BuildManifest(kHeader, outcomes)), WriteStyledJson(Parsed(R"({
    "tool_version": "1.2.3", "start": "2024-05-31T09:08:07Z", "end": "2024-05-31T09:09:00Z", "utc_offset_minutes": -210,
    "collectors": [
      {"name": "storage", "class": "DiskCollector", "outcome": "data",
       "records": 3, "bytes": 99, "milliseconds": 12, "errors": []},
      {"name": "network", "class": "NetworkCollector", "outcome": "no data",
       "records": 0, "bytes": 0, "milliseconds": 1, "errors": ["f: \u00e4"]},
      {"name": "services", "class": "ServiceCollector", "outcome": "failed", "reason": "bad",
       "records": 0, "bytes": 0, "milliseconds": 2, "errors": []},
      {"name": "printers", "class": "PrintersCollector", "outcome": "not written", "reason": "error 112",
       "records": 5, "bytes": 0, "milliseconds": 3, "errors": []}
    ]})")));
}

TEST(CollectionManifest, FileIsIndentedAndAFailureIsLogged) {
  const TestFolder folder;
  EXPECT_TRUE(WriteManifest(folder.Path(), kHeader, {}));
  std::string text;
  ASSERT_EQ(ReadWholeFile(folder.Path(L"collection_manifest.json"), 10'000, text), DWORD{ERROR_SUCCESS});
  EXPECT_EQ(text, WriteStyledJson(BuildManifest(kHeader, {})));

  logging::ErrorCapture errors;
  EXPECT_FALSE(WriteManifest(folder.Path(L"missing"), kHeader, {}));
  EXPECT_THAT(errors.Take(), testing::ElementsAre(testing::EndsWith(L"collection_manifest.json, error 3")));
}

TEST(CollectionManifest, TimeHasTheIsoForm) {
  EXPECT_THAT(CurrentTimeUtc(), testing::MatchesRegex("\\d\\d\\d\\d-\\d\\d-\\d\\dT\\d\\d:\\d\\d:\\d\\dZ"));
}

TEST(CollectionManifest, TheOffsetIsThatOfTheLocalTime) {
  SYSTEMTIME utc{};
  SYSTEMTIME local{};
  GetSystemTime(&utc);
  GetLocalTime(&local);
  const int minutes = (local.wHour - utc.wHour) * 60 + local.wMinute - utc.wMinute;
  // The clock moves between the calls, and the date may differ.
  EXPECT_LE(std::abs((CurrentUtcOffset() - minutes + 1440 + 720) % 1440 - 720), 1);
}

}  // namespace
}  // namespace systeminfo
