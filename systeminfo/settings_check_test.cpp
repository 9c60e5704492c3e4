#include "systeminfo/settings_check.h"

#include <gmock/gmock.h>

#include "core/json.h"

namespace systeminfo {
namespace {

const std::vector<std::string> kCollectors = {"system_summary", "storage", "network", "printers"};

TEST(UnknownKeys, EnabledKeysThatNameNothingAreFoundWithTheNearestName) {
  Json::Value document;
  std::string error;
  ASSERT_TRUE(ParseJson(R"({"output_folder":"x", "pretty_print":true, "all_collectors":false, "collector_timeout":5,
                            "storage":true, "network":false, "printers":[],
                            "systen_summary":true, "Storage":true, "prety_print":true, "registry":["a"],
                            "networks":null, "left_out":false})",
                        document, error));
  std::string found;
  for (const UnknownKey& unknown : FindUnknownKeys(document, kCollectors)) {
    found += unknown.key + ">" + unknown.nearest + " ";
  }
  EXPECT_EQ(found,
            "Storage>storage networks>network prety_print>pretty_print registry> systen_summary>system_summary ");
  EXPECT_TRUE(FindUnknownKeys(Json::Value(), kCollectors).empty());
  EXPECT_TRUE(FindUnknownKeys(Json::Value("text"), kCollectors).empty());
}

TEST(NearestKey, TwoEditsAreNearAndThreeAreNot) {
  struct {
    const char* key;
    const char* nearest;
  } const rows[] = {
      {"storag", "storage"},
      {"stoarge", "storage"},
      {"stoareg", "storage"},
      {"stor", ""},
      {"storagexx", "storage"},
      {"storagexxx", ""},
      {"NETWORK", "network"},
      {"", ""},
      {"printer", "printers"},
      {"xystorage", "storage"},
      {"system-summery", "system_summary"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(NearestKey(row.key, kCollectors), row.nearest) << row.key;
  EXPECT_EQ(NearestKey(std::string(1'000'000, 's'), kCollectors), "");
}

}  // namespace
}  // namespace systeminfo
