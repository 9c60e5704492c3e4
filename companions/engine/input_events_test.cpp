#include "companions/engine/input_events.h"

#include <gtest/gtest.h>

namespace engine {
namespace {

TEST(MouseEvents, ButtonsAndWheelAreTranslated) {
  Json::Value event = ToMouseEvent({WM_LBUTTONDOWN, MK_LBUTTON, 3, 4, 2, {false, true, false}});
  EXPECT_EQ(event["type"].asString(), "mousePressed");
  EXPECT_EQ(event["button"].asString(), "left");
  EXPECT_EQ(event["buttons"].asInt(), 1);
  EXPECT_EQ(event["clickCount"].asInt(), 2);
  EXPECT_EQ(event["modifiers"].asInt(), 2);
  event = ToMouseEvent({WM_MOUSEWHEEL, MAKEWPARAM(MK_RBUTTON, static_cast<WORD>(-240)), 0, 0, 0, {}});
  EXPECT_EQ(event["type"].asString(), "mouseWheel");
  EXPECT_EQ(event["deltaY"].asDouble(), 200);
  EXPECT_EQ(event["deltaX"].asDouble(), 0);
  EXPECT_EQ(event["buttons"].asInt(), 2);
  EXPECT_TRUE(ToMouseEvent({WM_XBUTTONDOWN, 0, 0, 0, 1, {}}).isNull());
}

TEST(KeyEvents, KeysHaveTheNamesThatScriptsKnow) {
  const struct {
    WPARAM key;
    wchar_t character;
    bool shift;
    const char* name;
  } cases[] = {{VK_RETURN, L'\r', false, "Enter"},
               {VK_LEFT, 0, false, "ArrowLeft"},
               {'A', L'A', false, "a"},
               {'A', L'A', true, "A"},
               {VK_F1, 0, false, "F1"},
               {VK_F24, 0, false, "F24"},
               {VK_OEM_CLEAR, 0, false, "Unidentified"}};
  for (const auto& one : cases) {
    const Json::Value event = ToKeyEvent({WM_KEYDOWN, one.key, 0, one.character, {false, false, one.shift}});
    EXPECT_EQ(event["key"].asString(), one.name);
    EXPECT_EQ(event["type"].asString(), "rawKeyDown");
  }
  EXPECT_TRUE(ToKeyEvent({WM_KEYDOWN, 'A', 1 << 30, L'A', {}})["autoRepeat"].asBool());
  EXPECT_FALSE(ToKeyEvent({WM_KEYUP, 'A', 1 << 30, L'A', {}})["autoRepeat"].asBool());
}

TEST(TextInput, JoinsSurrogatesAndDropsControls) {
  TextInput input;
  EXPECT_EQ((*input.Add(L'\u00e4'))["text"].asString(), "\xC3\xA4");
  EXPECT_FALSE(input.Add(0xD83D));
  EXPECT_EQ((*input.Add(0xDE00))["text"].asString(), "\xF0\x9F\x98\x80");
  EXPECT_FALSE(input.Add(0xDE00));  // no first half
  EXPECT_FALSE(input.Add(0x01));    // Ctrl+A
  EXPECT_FALSE(input.Add(L'\b'));
  EXPECT_EQ((*input.Add(L'\r'))["text"].asString(), "\r");
}

TEST(ClickCounter, CountsPressesThatAreNearInPlaceAndTime) {
  ClickCounter counter;
  EXPECT_EQ(counter.Press(WM_LBUTTONDOWN, 10, 10, 1000, 500), 1);
  EXPECT_EQ(counter.Press(WM_LBUTTONDBLCLK, 14, 10, 1500, 500), 2);
  EXPECT_EQ(counter.Press(WM_LBUTTONDOWN, 14, 10, 1501, 500), 3);
  EXPECT_EQ(counter.Press(WM_LBUTTONDOWN, 19, 10, 1502, 500), 1);
  EXPECT_EQ(counter.Press(WM_LBUTTONDOWN, 19, 10, 2003, 500), 1);
  EXPECT_EQ(counter.Press(WM_RBUTTONDOWN, 19, 10, 2004, 500), 1);
}

}  // namespace
}  // namespace engine
