// The value functions as a host calls them: by the table.
#include "companions/engine/value_table.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <thread>

#include "core/text.h"

namespace engine {
namespace {

const HtmlEngineApi& Api() {
  static const HtmlEngineApi s_api = [] {
    HtmlEngineApi api{};
    FillValueTable(api);
    return api;
  }();
  return s_api;
}

class Value {
 public:
  Value() { Api().ValueInit(&m_value); }
  explicit Value(const std::wstring& json) : Value() {
    const uint32_t left = Api().ValueFromString(&m_value, json.c_str(), static_cast<uint32_t>(json.size()), 1);
    EXPECT_EQ(left, 0u) << ToUtf8(json);
  }
  ~Value() { Api().ValueClear(&m_value); }
  Value(const Value&) = delete;
  Value& operator=(const Value&) = delete;

  HtmlValue* operator&() { return &m_value; }
  HtmlValue* operator->() { return &m_value; }

  std::string Json() {
    Value copy;
    Api().ValueCopy(&copy, &m_value);
    Api().ValueToString(&copy, HTML_CONVERT_JSON_LITERAL);
    return copy.String();
  }

  std::string String() {
    const wchar_t* text = nullptr;
    uint32_t chars = 0;
    EXPECT_EQ(Api().ValueStringData(&m_value, &text, &chars), 0u);
    return ToUtf8({text, chars});
  }

 private:
  HtmlValue m_value{};
};

TEST(ValueTable, LiteralsComeBackAsTheyWere) {
  const struct {
    const wchar_t* json;
    uint32_t type;
  } cases[] = {
      {L"null", HTML_VALUE_NULL},
      {L"true", HTML_VALUE_BOOL},
      {L"-7", HTML_VALUE_INT},
      {L"2.5", HTML_VALUE_FLOAT},
      {L"4294967296.5", HTML_VALUE_FLOAT},
      {L"\"a\\\"\\u00e4\"", HTML_VALUE_STRING},
      {L"[]", HTML_VALUE_ARRAY},
      {L"[1,[2,{\"a\":null}]]", HTML_VALUE_ARRAY},
      {L"{}", HTML_VALUE_MAP},
      {L"{\"a\":{\"m\":[1]},\"b\":\"\"}", HTML_VALUE_MAP},
  };
  for (const auto& one : cases) {
    Value value(one.json);
    EXPECT_EQ(value->type, one.type) << ToUtf8(one.json);
    EXPECT_EQ(value.Json(), ToUtf8(one.json));
  }
}

TEST(ValueTable, TextThatIsNoLiteralIsLeftUnparsed) {
  for (const std::wstring text : {L"", L"{", L"1,2", L"nothing", L"] , [", L"\"open"}) {
    Value value(L"\"before\"");
    EXPECT_EQ(Api().ValueFromString(&value, text.c_str(), static_cast<uint32_t>(text.size()), 1), text.size());
    EXPECT_EQ(value.String(), "before");
  }
}

TEST(ValueTable, PlainTextBecomesWhatItSays) {
  const struct {
    const wchar_t* text;
    uint32_t type;
  } cases[] = {{L"12", HTML_VALUE_INT},    {L"1e3", HTML_VALUE_INT},
               {L"0.5", HTML_VALUE_FLOAT}, {L"12a", HTML_VALUE_STRING},
               {L"", HTML_VALUE_STRING},   {L"true", HTML_VALUE_BOOL},
               {L"null", HTML_VALUE_NULL}, {L"undefined", HTML_VALUE_UNDEFINED},
               {L"inf", HTML_VALUE_STRING}};
  for (const auto& one : cases) {
    Value value;
    Api().ValueFromString(&value, one.text, static_cast<uint32_t>(wcslen(one.text)), HTML_CONVERT_SIMPLE);
    EXPECT_EQ(value->type, one.type) << ToUtf8(one.text);
  }
}

TEST(ValueTable, NumbersAreReadByTheirTypeOnly) {
  Value value;
  int32_t whole = 0;
  double real = 0;
  ASSERT_EQ(Api().ValueIntDataSet(&value, -5, HTML_VALUE_INT, 0), 0u);
  EXPECT_EQ(Api().ValueIntData(&value, &whole), 0u);
  EXPECT_EQ(whole, -5);
  EXPECT_EQ(Api().ValueFloatData(&value, &real), 0u);  // every whole number is one
  EXPECT_EQ(real, -5);
  ASSERT_EQ(Api().ValueFloatDataSet(&value, -0.25, HTML_VALUE_FLOAT, 0), 0u);
  EXPECT_EQ(Api().ValueIntData(&value, &whole), HTML_VALUE_INCOMPATIBLE_TYPE);
  ASSERT_EQ(Api().ValueIntDataSet(&value, 17, HTML_VALUE_BOOL, 0), 0u);
  EXPECT_EQ(value.Json(), "true");
  EXPECT_EQ(Api().ValueFloatData(&value, &real), HTML_VALUE_INCOMPATIBLE_TYPE);
  EXPECT_EQ(Api().ValueIntDataSet(&value, 1, HTML_VALUE_STRING, 0), HTML_VALUE_INCOMPATIBLE_TYPE);
}

TEST(ValueTable, CopiesAreIndependent) {
  Value one(L"{\"list\":[1,2]}");
  Value other;
  ASSERT_EQ(Api().ValueCopy(&other, &one), 0u);
  Value key(L"\"list\"");
  Value three(L"3");
  Value list;
  ASSERT_EQ(Api().ValueGetValueOfKey(&other, &key, &list), 0u);
  ASSERT_EQ(Api().ValueNthElementValueSet(&list, 3, &three), 0u);
  EXPECT_EQ(list.Json(), "[1,2,null,3]");
  EXPECT_EQ(other.Json(), "{\"list\":[1,2]}");
  ASSERT_EQ(Api().ValueSetValueToKey(&other, &key, &list), 0u);
  EXPECT_EQ(other.Json(), "{\"list\":[1,2,null,3]}");
  EXPECT_EQ(one.Json(), "{\"list\":[1,2]}");
}

TEST(ValueTable, SettingMakesAnArrayOrAMap) {
  Value element(L"\"x\"");
  Value value(L"5");
  ASSERT_EQ(Api().ValueNthElementValueSet(&value, 1, &element), 0u);
  EXPECT_EQ(value.Json(), "[null,\"x\"]");
  ASSERT_EQ(Api().ValueSetValueToKey(&value, &element, &element), 0u);
  EXPECT_EQ(value.Json(), "{\"x\":\"x\"}");
  Value seven(L"7");
  ASSERT_EQ(Api().ValueNthElementValueSet(&value, 0, &seven), 0u);  // of a map: the value of its n-th key
  EXPECT_EQ(value.Json(), "{\"x\":7}");
}

TEST(ValueTable, AValuePutIntoItselfIsCopiedFirst) {
  Value value(L"[1]");
  ASSERT_EQ(Api().ValueNthElementValueSet(&value, 0, &value), 0u);
  EXPECT_EQ(value.Json(), "[[1]]");
  ASSERT_EQ(Api().ValueNthElementValue(&value, 0, &value), 0u);
  EXPECT_EQ(value.Json(), "[1]");
}

TEST(ValueTable, EntriesComeInTheOrderOfInsertion) {
  Value map;
  for (const wchar_t* name : {L"\"z\"", L"\"a\"", L"\"m\""}) {
    Value key(name);
    ASSERT_EQ(Api().ValueSetValueToKey(&map, &key, &key), 0u);
  }
  std::string seen;
  const auto collect = [](void* param, const HtmlValue* key, const HtmlValue*) -> BOOL {
    const wchar_t* text = nullptr;
    uint32_t chars = 0;
    Api().ValueStringData(key, &text, &chars);
    *static_cast<std::string*>(param) += ToUtf8({text, chars});
    return chars == 1 && *text != L'a';
  };
  EXPECT_EQ(Api().ValueEnumElements(&map, collect, &seen), 0u);
  EXPECT_EQ(seen, "za");  // false ends it
  Value key;
  ASSERT_EQ(Api().ValueNthElementKey(&map, 2, &key), 0u);
  EXPECT_EQ(key.String(), "m");
}

TEST(ValueTable, WhatCannotBeIsRefused) {
  Value array(L"[1]");
  Value number(L"1");
  Value out;
  int32_t count = -1;
  EXPECT_EQ(Api().ValueNthElementValue(&array, 1, &out), HTML_VALUE_BAD_PARAMETER);
  EXPECT_EQ(Api().ValueNthElementValue(&array, -1, &out), HTML_VALUE_BAD_PARAMETER);
  EXPECT_EQ(Api().ValueNthElementValueSet(&array, std::numeric_limits<int32_t>::max(), &number),
            HTML_VALUE_BAD_PARAMETER);
  EXPECT_EQ(Api().ValueNthElementValue(&number, 0, &out), HTML_VALUE_INCOMPATIBLE_TYPE);
  EXPECT_EQ(Api().ValueElementsCount(&number, &count), HTML_VALUE_INCOMPATIBLE_TYPE);
  EXPECT_EQ(count, 0);
  EXPECT_EQ(Api().ValueGetValueOfKey(&array, &number, &out), HTML_VALUE_INCOMPATIBLE_TYPE);
  EXPECT_EQ(Api().ValueStringDataSet(&out, nullptr, 3, 0), HTML_VALUE_BAD_PARAMETER);
  EXPECT_EQ(Api().ValueInvoke(&number, nullptr, 0, nullptr, nullptr, nullptr), HTML_VALUE_INCOMPATIBLE_TYPE);
  EXPECT_EQ(Api().ValueInit(nullptr), HTML_VALUE_BAD_PARAMETER);
  EXPECT_EQ(Api().ValueCopy(&out, nullptr), HTML_VALUE_BAD_PARAMETER);
  EXPECT_EQ(array.Json(), "[1]");
}

TEST(ValueTable, AMissingKeyIsUndefined) {
  Value map(L"{\"a\":1}");
  Value key(L"\"b\"");
  Value out(L"1");
  EXPECT_EQ(Api().ValueGetValueOfKey(&map, &key, &out), 0u);
  EXPECT_EQ(out->type, static_cast<uint32_t>(HTML_VALUE_UNDEFINED));
}

// --- Functions

class Home : public FunctionHome {
 public:
  bool CallFunction(uint64_t id, const std::vector<ScriptValue>& arguments, ScriptValue& result) override {
    result = arguments.empty() ? ScriptValue(static_cast<int32_t>(id)) : arguments[0];
    return id == 7;
  }
  void ReleaseFunction(uint64_t id) noexcept override { released = id; }

  uint64_t released = 0;
};

TEST(ValueTable, AFunctionIsCalledInItsHomeAndReleasedWithItsLastCopy) {
  const auto home = std::make_shared<Home>();
  Value copy;
  {
    Value function;
    WriteValue(ScriptValue(ScriptValue::Function(std::make_shared<ScriptFunction>(home, 7))), *&function);
    EXPECT_EQ(function->type, static_cast<uint32_t>(HTML_VALUE_OBJECT));
    EXPECT_EQ(function->unit, static_cast<uint32_t>(HTML_OBJECT_FUNCTION));
    ASSERT_EQ(Api().ValueCopy(&copy, &function), 0u);
  }
  EXPECT_EQ(home->released, 0u);
  Value result;
  Value argument(L"[3]");
  EXPECT_EQ(Api().ValueInvoke(&copy, nullptr, 1, &argument, &result, nullptr), 0u);
  EXPECT_EQ(result.Json(), "[3]");
  EXPECT_EQ(Api().ValueIsolate(&copy), 0u);
  std::thread([&] { Api().ValueClear(&copy); }).join();
  EXPECT_EQ(home->released, 7u);
}

TEST(ValueTable, AFunctionWhosePageIsGoneSaysSo) {
  auto home = std::make_shared<Home>();
  Value function;
  WriteValue(ScriptValue(ScriptValue::Function(std::make_shared<ScriptFunction>(home, 7))), *&function);
  home.reset();
  Value result;
  EXPECT_NE(Api().ValueInvoke(&function, nullptr, 0, nullptr, &result, nullptr), 0u);
  EXPECT_EQ(result->unit, static_cast<uint32_t>(HTML_STRING_ERROR));
  EXPECT_EQ(result.String(), "the page of the function is gone");
}

}  // namespace
}  // namespace engine
