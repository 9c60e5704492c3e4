#include "gui/engine_value.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "tests/support/fake_html_engine.h"

namespace {

using Node = FakeHtmlEngine::Node;
using qx::Value;
using qx::gui::ConversionError;

// Through the engine and back.
Value RoundTrip(FakeHtmlEngine& engine, const Value& value) {
  qx::gui::EngineValue target(engine.Api());
  qx::gui::ToEngine(engine.Api(), value, *target.Receive());
  return qx::gui::FromEngine(engine.Api(), *target.Get());
}

Value Read(FakeHtmlEngine& engine, const Node& node) {
  HtmlValue value = engine.Make(node);
  try {
    Value result = qx::gui::FromEngine(engine.Api(), value);
    engine.Clear(value);
    return result;
  } catch (...) {
    engine.Clear(value);
    throw;
  }
}

Node Nested(size_t levels) {
  Node node = Node::Int(1);
  for (size_t i = 0; i < levels; ++i) {
    Node outer;
    outer.type = i % 2 == 0 ? HTML_VALUE_ARRAY : HTML_VALUE_MAP;
    if (i % 2 == 0) {
      outer.elements.push_back(std::move(node));
    } else {
      outer.members.emplace_back(L"m", std::move(node));
    }
    node = std::move(outer);
  }
  return node;
}

}  // namespace

TEST(EngineValue, NumbersAndTextsKeepEveryBit) {
  FakeHtmlEngine engine;
  for (const double number : {0.0, -0.0, 1.0, -2147483648.0, 2147483647.0, 2147483648.0, 0.1, 1e300, 5e-324,
                              std::numeric_limits<double>::infinity()}) {
    const double result = RoundTrip(engine, number).AsNumber();
    EXPECT_EQ(result, number);
    EXPECT_EQ(std::signbit(result), std::signbit(number));
  }
  EXPECT_TRUE(std::isnan(RoundTrip(engine, std::nan("")).AsNumber()));
  for (const std::wstring& text :
       {std::wstring(), std::wstring(L"\0a\xD800\uFFFF\r\n", 6), std::wstring(100000, L'x')}) {
    EXPECT_EQ(std::wstring(RoundTrip(engine, text).AsString()), text);
  }
  EXPECT_EQ(engine.LiveValues(), 0u);
}

TEST(EngineValue, WholeNumbersReachTheScriptAsSuch) {
  FakeHtmlEngine engine;
  const struct {
    double number;
    uint32_t type;
  } cases[] = {
      {3, HTML_VALUE_INT}, {-0.0, HTML_VALUE_FLOAT}, {3.5, HTML_VALUE_FLOAT}, {2147483648.0, HTML_VALUE_FLOAT}};
  for (const auto& one : cases) {
    qx::gui::EngineValue target(engine.Api());
    qx::gui::ToEngine(engine.Api(), one.number, *target.Receive());
    EXPECT_EQ(engine.Of(*target.Get()).type, one.type) << one.number;
  }
}

TEST(EngineValue, TreesComeBackWithTheirOrderAndEmptyOnesKeepTheirKind) {
  FakeHtmlEngine engine;
  Value tree;
  tree.SetMember(L"z", Value());
  tree.SetMember(L"a", Value::EmptyArray());
  tree.SetMember(L"", Value::EmptyObject());
  tree.SetMember(L"b", true).GetType();
  tree.Member(L"a").Append(false);
  tree.Member(L"a").Append(Value::EmptyArray());
  const Value result = RoundTrip(engine, tree);
  EXPECT_EQ(result.ToText(), tree.ToText());
  EXPECT_EQ(result.Keys(), tree.Keys());
  EXPECT_EQ(engine.LiveValues(), 0u);
}

TEST(EngineValue, ScriptObjectsBecomePlainAndWhatIsNoDataBecomesNull) {
  FakeHtmlEngine engine;
  Node object = Node::From(Value::FromJson(Json::Value(Json::objectValue)));
  object.type = HTML_VALUE_OBJECT;
  object.unit = HTML_OBJECT_OBJECT;
  object.members.emplace_back(L"n", Node::Int(7));
  object.members.emplace_back(L"f", Node::Callable([](const std::vector<Value>&) { return Value(); }));
  EXPECT_EQ(Read(engine, object).ToText(), L"{ \"f\" : null, \"n\" : 7 }");
  Node array;
  array.type = HTML_VALUE_OBJECT;
  array.unit = HTML_OBJECT_ARRAY;
  array.elements.push_back(Node::Int(1));
  EXPECT_EQ(Read(engine, array).ToText(), L"[ 1 ]");
  Node date;
  date.type = HTML_VALUE_DATE;
  date.text = L"2026-01-02";
  EXPECT_EQ(Read(engine, date).ToText(), L"\"2026-01-02\"");
  for (const uint32_t type : {0u, 1u, 11u, 12u, 99u}) {
    Node odd;
    odd.type = type;
    EXPECT_EQ(Read(engine, odd).GetType(), Value::kNull) << type;
  }
  Node native;
  native.type = HTML_VALUE_OBJECT;
  native.unit = HTML_OBJECT_NATIVE;
  EXPECT_EQ(Read(engine, native).GetType(), Value::kNull);
  EXPECT_EQ(engine.LiveValues(), 0u);
}

TEST(EngineValue, MessagesBeyondTheLimitsAreRefusedAndNothingIsLeft) {
  FakeHtmlEngine engine;
  EXPECT_NO_THROW(Read(engine, Nested(qx::gui::kMostMessageLevels)));
  EXPECT_THROW(Read(engine, Nested(qx::gui::kMostMessageLevels + 1)), ConversionError);
  EXPECT_THROW(Read(engine, Nested(900)), ConversionError);
  Node many;
  many.type = HTML_VALUE_ARRAY;
  many.elements.resize(qx::gui::kMostMessageValues);
  EXPECT_THROW(Read(engine, many), ConversionError);
  Node wide;
  wide.type = HTML_VALUE_MAP;
  for (size_t i = 0; i <= qx::gui::kMostObjectMembers; ++i)
    wide.members.emplace_back(std::to_wstring(i), Node::Int(0));
  EXPECT_THROW(Read(engine, wide), ConversionError);
  Node texts;
  texts.type = HTML_VALUE_ARRAY;
  for (int i = 0; i < 3; ++i)
    texts.elements.push_back(Node::From(Value(std::wstring(qx::gui::kMostMessageCharacters / 2, L'x'))));
  EXPECT_THROW(Read(engine, texts), ConversionError);
  Value deep;
  for (size_t i = 0; i <= qx::gui::kMostMessageLevels; ++i) {
    Value outer;
    outer.Append(std::move(deep));
    deep = std::move(outer);
  }
  EXPECT_THROW(RoundTrip(engine, deep), ConversionError);
  EXPECT_EQ(engine.LiveValues(), 0u);
}
