#include "companions/engine/devtools_message.h"

#include <gtest/gtest.h>

namespace engine {
namespace {

TEST(DevToolsMessage, TellsAnswersFromEvents) {
  std::string error;
  auto message = ParseDevToolsMessage(R"({"id":4,"result":{"a":1},"sessionId":"S"})", error);
  ASSERT_TRUE(message);
  EXPECT_EQ(message->kind, DevToolsMessage::Kind::kAnswer);
  EXPECT_EQ(message->id, 4u);
  EXPECT_EQ(NumberOf(message->content, "a"), 1);
  EXPECT_EQ(message->sessionId, "S");
  EXPECT_TRUE(message->error.empty());
  message = ParseDevToolsMessage(R"({"method":"Page.x","params":{"name":"n"}})", error);
  ASSERT_TRUE(message);
  EXPECT_EQ(message->kind, DevToolsMessage::Kind::kEvent);
  EXPECT_EQ(TextOf(message->content, "name"), "n");
  EXPECT_EQ(TextOf(message->content, "missing"), "");
  message = ParseDevToolsMessage(R"({"id":5,"error":{"message":"no such thing"}})", error);
  ASSERT_TRUE(message);
  EXPECT_EQ(message->error, "no such thing");
  EXPECT_TRUE(message->content.isObject());
}

TEST(DevToolsMessage, GarbageIsNoMessage) {
  const std::string deep(5000, '[');
  for (const std::string& text :
       {std::string(), std::string("hello"), std::string("[]"), std::string("7"), std::string("{}"),
        std::string(R"({"id":"4"})"), std::string(R"({"id":-1})"), std::string(R"({"method":7})"),
        std::string("{\"id\":4"), std::string("\0\0", 2), deep}) {
    std::string error;
    EXPECT_FALSE(ParseDevToolsMessage(text, error)) << text.substr(0, 20);
    EXPECT_FALSE(error.empty()) << text.substr(0, 20);
  }
}

TEST(DevToolsMessage, PartsOfTheWrongTypeAreEmpty) {
  std::string error;
  for (const char* text : {R"({"method":"m","params":7})", R"({"method":"m"})", R"({"method":"m","params":[1]})"}) {
    const auto message = ParseDevToolsMessage(text, error);
    ASSERT_TRUE(message);
    EXPECT_TRUE(message->content.isObject() && message->content.empty());
  }
  EXPECT_EQ(TextOf(Json::Value(7), "x"), "");
  EXPECT_TRUE(MemberOf(Json::Value("text"), "x").isNull());
}

TEST(ActivePort, ReadsPortAndPathOfAWholeFileOnly) {
  const auto address = ParseActivePort("40123\n/devtools/browser/ab-12\n");
  ASSERT_TRUE(address);
  EXPECT_EQ(address->port, 40123);
  EXPECT_EQ(address->path, "/devtools/browser/ab-12");
  EXPECT_EQ(ParseActivePort("1\n/devtools/browser/x\r\n")->path, "/devtools/browser/x");
  for (const char* text :
       {"", "40123", "40123\n", "0\n/devtools/browser/x", "65536\n/devtools/browser/x", "-1\n/devtools/browser/x",
        "12a\n/devtools/browser/x", "1\n/other", "1\n/devtools/browser/x y"}) {
    EXPECT_FALSE(ParseActivePort(text)) << text;
  }
}

TEST(MessageSplitter, CutsAtZeroBytesWhereverTheyFall) {
  MessageSplitter splitter;
  std::vector<std::string> messages;
  for (const char c : std::string("one\0\0three\0fo", 13)) {
    ASSERT_TRUE(splitter.Add({&c, 1}));
    while (auto message = splitter.Next())
      messages.push_back(*message);
  }
  EXPECT_EQ(messages, (std::vector<std::string>{"one", "", "three"}));
}

TEST(MessageSplitter, GivesUpOnAMessageWithoutEnd) {
  MessageSplitter splitter;
  const std::string block(1 << 20, 'x');
  size_t accepted = 0;
  while (splitter.Add(block) && accepted < 2 * kLargestMessage)
    accepted += block.size(), splitter.Next();
  EXPECT_EQ(accepted, kLargestMessage);
}

}  // namespace
}  // namespace engine
