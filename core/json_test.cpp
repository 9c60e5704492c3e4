#include "core/json.h"

#include <gtest/gtest.h>

namespace {

// `levels` arrays within each other.
std::string Nested(size_t levels) {
  return std::string(levels, '[') + std::string(levels, ']');
}

}  // namespace

TEST(ParseJson, AcceptsAByteOrderMarkAndComments) {
  Json::Value value;
  std::string error;
  EXPECT_TRUE(ParseJson("\xEF\xBB\xBF{\"a\": 1} // end", value, error)) << error;
  EXPECT_EQ(value["a"].asInt(), 1);
  EXPECT_TRUE(ParseJson("/* start */ [true]", value, error)) << error;
  EXPECT_EQ(WriteCompactJson(value), "[true]\n");
}

TEST(ParseJson, RefusesWhatIsNoDocumentAndLeavesNull) {
  for (const char* text : {"", "\xEF\xBB\xBF", "{", "{\"a\" 1}", "[1,]", "\"open", "nul", "\xFF\xFE{"}) {
    Json::Value value(5);
    std::string error;
    EXPECT_FALSE(ParseJson(text, value, error)) << text;
    EXPECT_TRUE(value.isNull()) << text;
    EXPECT_FALSE(error.empty()) << text;
  }
}

TEST(ParseJson, IgnoresWhatFollowsTheDocument) {
  Json::Value value;
  std::string error;
  for (const char* text : {"{\"a\": 1} trailing", "{\"a\": 1} {\"a\": 2}", "{\"a\": 1}\r\n\x1A"}) {
    EXPECT_TRUE(ParseJson(text, value, error)) << text;
    EXPECT_EQ(WriteCompactJson(value), "{\"a\":1}\n") << text;
  }
}

TEST(ParseJson, NestingIsBounded) {
  Json::Value value;
  std::string error;
  EXPECT_TRUE(ParseJson(Nested(900), value, error)) << error;
  for (const std::string& text : {Nested(1100), Nested(100'000), std::string(100'000, '[')}) {
    EXPECT_FALSE(ParseJson(text, value, error));
    EXPECT_TRUE(value.isNull());
    EXPECT_FALSE(error.empty());
  }
}

TEST(WriteJson, StyledFilesHaveTheLayoutThatPeopleCompare) {
  Json::Value value;
  value["name"] = "tool";
  value["list"].append(1);
  value["list"].append(2.5);
  value["empty"] = Json::Value(Json::arrayValue);
  value["folder"]["deep"] = Json::Value();
  value["long"].append(std::string(40, 'a'));
  value["long"].append(std::string(40, 'b'));
  EXPECT_EQ(WriteStyledJson(value),
            "{\n"
            "   \"empty\" : [],\n"
            "   \"folder\" : {\n"
            "      \"deep\" : null\n"
            "   },\n"
            "   \"list\" : [ 1, 2.5 ],\n"
            "   \"long\" : [\n"
            "      \"" +
                std::string(40, 'a') +
                "\",\n"
                "      \"" +
                std::string(40, 'b') +
                "\"\n"
                "   ],\n"
                "   \"name\" : \"tool\"\n"
                "}\n");
  EXPECT_EQ(WriteCompactJson(value["list"]), "[1,2.5]\n");
}
