#include "systeminfo/settings_document.h"

#include <gtest/gtest.h>

namespace systeminfo {
namespace {

Json::Value Document(std::string_view text) {
  Json::Value document;
  std::string error;
  EXPECT_TRUE(ParseSettingsDocument(text, document, error)) << text << "\n" << error;
  return document;
}

TEST(SettingsDocument, TextThatIsNoObjectIsRefusedWithAMessageAndKeepsTheOldDocument) {
  const std::string bad[] = {
      "",
      "   ",
      "not json",
      "{",
      "{\"a\":}",
      "[true]",
      "null",
      "\"all_collectors\"",
      "\xEF\xBB\xBF",
      std::string("\xFF\xFE{\0}\0", 6),
      std::string("\xFE\xFF\0{\0}", 6),
      std::string("{\0}\0", 4),
      std::string(100'000, '['),
      "{\"registry\":" + std::string(100'000, '[') + std::string(100'000, ']') + "}",
  };
  for (const std::string& text : bad) {
    Json::Value document = Document(R"({"kept":1})");
    std::string error;
    EXPECT_FALSE(ParseSettingsDocument(text, document, error)) << text.substr(0, 40);
    EXPECT_FALSE(error.empty()) << text.substr(0, 40);
    EXPECT_TRUE(document.isMember("kept")) << text.substr(0, 40);
  }
}

TEST(SettingsDocument, ByteOrderMarkAndCommentsAreAccepted) {
  EXPECT_TRUE(IsSettingTrue(Document("\xEF\xBB\xBF{\"pretty_print\":true}"), "pretty_print"));
  EXPECT_TRUE(IsSettingTrue(Document("// why\n{ /* a */ \"pretty_print\" : true }"), "pretty_print"));
}

TEST(SettingsDocument, OnlyBooleanTrueIsTrue) {
  const Json::Value document = Document(R"({"t":true,"f":false,"s":"true","n":1,"z":null,"o":{}})");
  EXPECT_TRUE(IsSettingTrue(document, "t"));
  for (const char* key : {"f", "s", "n", "z", "o", "T", "absent", ""})
    EXPECT_FALSE(IsSettingTrue(document, key)) << key;
  EXPECT_FALSE(IsSettingTrue(Json::Value(), "t"));
  EXPECT_FALSE(IsSettingTrue(Json::Value("text"), "t"));
}

TEST(SettingsDocument, CollectorTimeoutIsANumberOfSecondsWithinItsRange) {
  using std::chrono::milliseconds;
  struct {
    const char* document;
    std::optional<milliseconds> timeout;
  } const rows[] = {
      {R"({})", milliseconds(600'000)},
      {R"({"collector_timeout":0})", milliseconds(0)},
      {R"({"collector_timeout":0.0001})", milliseconds(1)},
      {R"({"collector_timeout":1.5})", milliseconds(1500)},
      {R"({"collector_timeout":604800})", milliseconds(604'800'000)},
      {R"({"collector_timeout":604801})", std::nullopt},
      {R"({"collector_timeout":-1})", std::nullopt},
      {R"({"collector_timeout":1e300})", std::nullopt},
      {R"({"collector_timeout":18446744073709551615})", std::nullopt},
      {R"({"collector_timeout":"60"})", std::nullopt},
      {R"({"collector_timeout":true})", std::nullopt},
      {R"({"collector_timeout":null})", std::nullopt},
  };
  for (const auto& row : rows)
    EXPECT_EQ(CollectorTimeout(Document(row.document)), row.timeout) << row.document;
  EXPECT_EQ(CollectorTimeout(Json::Value()), milliseconds(kDefaultCollectorTimeout));
}

TEST(SettingsDocument, CollectorIsEnabledByAnythingButFalse) {
  struct {
    const char* document;
    bool enabled;
  } const rows[] = {
      {R"({})", false},
      {R"({"storage":true})", true},
      {R"({"storage":false})", false},
      {R"({"storage":0})", true},
      {R"({"storage":""})", true},
      {R"({"storage":null})", true},
      {R"({"storage":[]})", true},
      {R"({"storage":{"a":false}})", true},
      {R"({"Storage":true})", false},
      {R"({"all_collectors":true})", true},
      {R"({"all_collectors":true,"storage":false})", true},
      {R"({"all_collectors":"yes"})", false},
      {R"({"all_collectors":1})", false},
      {R"({"all_collectors":false,"storage":true})", true},
  };
  for (const auto& row : rows)
    EXPECT_EQ(IsCollectorEnabled(Document(row.document), "storage"), row.enabled) << row.document;
  EXPECT_FALSE(IsCollectorEnabled(Json::Value(), "storage"));
}

}  // namespace
}  // namespace systeminfo
