// The rules of the window, the language and the user's details: plain functions over plain data.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <random>
#include <regex>

#include "gui/install_info.h"
#include "gui/language.h"
#include "gui/user_details.h"
#include "gui/window_rules.h"

namespace {

using testing::HasSubstr;

bool Parses(const std::string& yaml, qx::Value& value) {
  std::string error;
  const bool parsed = qx::ParseYaml(yaml, value, error);
  EXPECT_EQ(parsed, error.empty()) << error;
  return parsed;
}

std::string ErrorOf(const std::string& yaml) {
  qx::Value value;
  std::string error;
  return qx::ParseYaml(yaml, value, error) ? "" : error;
}

// Nine levels of nine aliases each stand for 9^9 values.
std::string AliasBomb() {
  std::string text = "a: &a [x, x, x, x, x, x, x, x, x]\n";
  for (char level = 'b'; level <= 'i'; ++level) {
    text += std::string(1, level) + ": &" + level + " [";
    for (int i = 0; i < 9; ++i)
      text += std::string(i == 0 ? "*" : ", *") + static_cast<char>(level - 1);
    text += "]\n";
  }
  return text;
}

}  // namespace

TEST(WindowPlace, IsCentredOnTheSizeOfTheWorkAreaWithoutItsOrigin) {
  const struct {
    SIZE page;
    RECT area;
    POINT place;
  } cases[] = {
      {{800, 600}, {0, 0, 1920, 1040}, {560, 220}},
      {{800, 600}, {100, 40, 1920, 1080}, {510, 220}},  // task bars on the left and at the top
      {{801, 601}, {0, 0, 1001, 801}, {100, 100}},      // each half is rounded down for itself
      {{3000, 2000}, {0, 0, 1000, 800}, {-1000, -600}},
  };
  for (const auto& one : cases) {
    const RECT place = qx::gui::CentredPlace(one.page, one.area);
    EXPECT_EQ(place.left, one.place.x);
    EXPECT_EQ(place.top, one.place.y);
    EXPECT_EQ(place.right - place.left, one.page.cx);
    EXPECT_EQ(place.bottom - place.top, one.page.cy);
  }
}

TEST(ResourceAddress, NamesAResourceAndItsType) {
  const struct {
    const wchar_t* address;
    const wchar_t* name;
    const wchar_t* type;
    bool isHtml;
  } cases[] = {
      {L"res:page.htm", L"page.htm", L"htm", true},     {L"res://page.HTML", L"page.HTML", L"HTML", true},
      {L"res:a.b.png", L"a.b.png", L"png", false},      {L"res:", L"", L"", false},
      {L"res:noextension", L"noextension", L"", false}, {L"this://app/x.css", L"this://app/x.css", L"css", false},
  };
  for (const auto& one : cases) {
    const auto address = qx::gui::ParseResourceAddress(one.address);
    ASSERT_TRUE(address) << testing::PrintToString(std::wstring(one.address));
    EXPECT_EQ(address->name, one.name);
    EXPECT_EQ(address->type, one.type);
    EXPECT_EQ(address->isHtml, one.isHtml);
  }
  for (const wchar_t* address : {L"", L"file://C:/x.htm", L"https://res:x", L"this://other/x", L"RES:x.htm"}) {
    EXPECT_FALSE(qx::gui::ParseResourceAddress(address)) << testing::PrintToString(std::wstring(address));
  }
  EXPECT_EQ(qx::gui::ParseResourceAddress(L"res:" + std::wstring(300, L'x'))->name.size(), 260u);
}

TEST(EmailAddress, IsWhatTheExpressionMatchesAsAWhole) {
  const std::regex expression(R"([_a-z0-9-]+(\.[_a-z0-9-]+)*@[a-z0-9-]+(\.[a-z0-9-]+)*(\.[a-z]{2,4}))");
  const auto agrees = [&expression](const std::string& text) {
    const bool expected = std::regex_match(text, expression);
    EXPECT_EQ(qx::IsEmailAddress(std::wstring(text.begin(), text.end())), expected) << text;
    return expected;
  };
  EXPECT_TRUE(agrees("first.last_1@mail.some-site.info"));
  EXPECT_TRUE(agrees("-@-.aa"));
  for (const char* text : {"", "@", "a@b", "a@.cc", ".a@b.cc", "a.@b.cc", "a@b.ccccc", "a@b.c", "A@b.cc", "a@b.cc ",
                           "a@@b.cc", "a@b_c.dd", "a@b..cc", "a b@c.dd", "a@b.c1", "a.b.cc"}) {
    EXPECT_FALSE(agrees(text));
  }
  std::mt19937 random(7);
  int matches = 0;
  for (int i = 0; i < 60000; ++i) {
    std::string text;
    for (size_t length = random() % 9 + 5; length > 0; --length)
      text += "aaab@.-_1A"[random() % 10];
    matches += agrees(text) ? 1 : 0;
  }
  EXPECT_GT(matches, 20);
  EXPECT_FALSE(qx::IsEmailAddress(std::wstring(5'000'000, L'a') + L"@"));
}

TEST(Language, PageIsTheOneOfTheExactNameOrTheEnglishOne) {
  EXPECT_EQ(qx::PageForLanguage(L"english"), L"support_tool_en");
  EXPECT_EQ(qx::PageForLanguage(L"romana"), L"support_tool_ro");
  for (const wchar_t* other : {L"English", L"", L"francais", L"romana "})
    EXPECT_EQ(qx::PageForLanguage(other), L"support_tool_en");
  EXPECT_EQ(qx::CatalogueOfPage(L"support_tool_ro"), L"ro");
}

TEST(InstallInfo, ScalarsAreTextAndAliasesAreWhatTheyStandFor) {
  qx::Value value;
  ASSERT_TRUE(
      Parses("\xEF\xBB\xBFUserPreferences: &p\n  language: rom\xC3\xA2na\n  n: 1\n  t: yes\n"
             "list: [~, *p, {}]\n? [odd, key]\n: dropped\nlast: |\n  two\n  lines\n",
             value));
  EXPECT_EQ(value.Member(L"UserPreferences").Member(L"language").AsString(), L"rom\u00E2na");
  EXPECT_EQ(value.Member(L"UserPreferences").Member(L"n").AsString(), L"1");
  EXPECT_EQ(value.Member(L"list").Element(1).Member(L"t").AsString(), L"yes");
  EXPECT_EQ(value.Member(L"last").AsString(), L"two\nlines\n");
  EXPECT_EQ(value.Size(), 3u);
  for (const char* text : {"", "# nothing\n", "---\n...\n"}) {
    qx::Value nothing;
    EXPECT_TRUE(Parses(text, nothing)) << text;
    EXPECT_FALSE(nothing.IsTrue()) << text;
  }
}

TEST(InstallInfo, BadDocumentsEndWithAReason) {
  EXPECT_THAT(ErrorOf("a: [1, 2"), HasSubstr("in line"));
  EXPECT_THAT(ErrorOf("a: b: c"), HasSubstr("in line 1"));
  EXPECT_NE(ErrorOf(std::string("\0\1\2", 3)), "");
  EXPECT_NE(ErrorOf("a: *nowhere"), "");
  EXPECT_EQ(ErrorOf(AliasBomb()), "too many values");
  EXPECT_EQ(ErrorOf("&a [*a]"), "a value contains itself");
  for (const char* level : {"[", "{", "- ", "? "}) {
    std::string deep;
    for (int i = 0; i < 500'000; ++i)
      deep += level;
    EXPECT_EQ(ErrorOf(deep), "nested too deeply") << level;
  }
  std::string anchors;
  for (int i = 0; i < 60'000; ++i)
    anchors += "- &a" + std::to_string(i) + " x\n";
  EXPECT_EQ(ErrorOf(anchors), "too many anchors");
  std::string wide;
  for (int i = 0; i < 5000; ++i)
    wide += "k" + std::to_string(i) + ": v\n";
  EXPECT_EQ(ErrorOf(wide), "too many members in one mapping");
  std::string texts = "a: &a " + std::string(500'000, 'x') + "\nb: [";
  for (int i = 0; i < 1000; ++i)
    texts += "*a, ";
  EXPECT_EQ(ErrorOf(texts + "]"), "too much text");
}
