#include "core/value.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <functional>

#include "core/json.h"
#include "core/text.h"

using qx::Value;

namespace {

Value Sample() {
  Value value;
  value.SetMember(L"b", 1.5);
  value.SetMember(L"A", Value::EmptyArray()).Append(L"x \"y\"");
  value.SetMember(L"a", true);
  value.SetMember(L"n", Value());
  value.SetMember(L"o", Value::EmptyObject());
  return value;
}

std::string MessageOf(const std::function<void()>& action) {
  try {
    action();
  } catch (const qx::ValueException& exception) {
    return exception.what();
  }
  return "nothing thrown";
}

// Memory functions that count.
int g_allocated = 0;
int g_freed = 0;
void* CountedAllocate(size_t bytes) {
  ++g_allocated;
  return std::malloc(bytes);
}
void CountedFree(void* memory) {
  ++g_freed;
  std::free(memory);
}
void* NoMemory(size_t) {
  return nullptr;
}
constexpr qx::MemoryFunctions kCounted{&CountedAllocate, nullptr, &CountedFree};
constexpr qx::MemoryFunctions kNone{&NoMemory, nullptr, &CountedFree};

}  // namespace

TEST(Value, TypeNamesTruthAndText) {
  const Value emptyArray = Value::EmptyArray();
  const Value emptyObject = Value::EmptyObject();
  Value full;
  full.Append(Value());
  struct {
    Value value;
    const wchar_t* typeName;
    bool isTrue;
    const wchar_t* text;
  } const rows[] = {
      {Value(), L"null", false, L"null"},
      {0, L"number", false, L"0"},
      {-0.0, L"number", false, L"-0"},
      {2, L"number", true, L"2"},
      {1234567.0, L"number", true, L"1.23457e+06"},
      {0.1 + 0.2, L"number", true, L"0.3"},
      {true, L"bool", true, L"true"},
      {false, L"bool", false, L"false"},
      {L"", L"string", false, L"\"\""},
      {std::wstring(L"a\"b\\"), L"string", true, L"\"a\"b\\\""},
      {emptyArray, L"array", false, L"[  ]"},
      {full, L"array", true, L"[ null ]"},
      {emptyObject, L"object", false, L"{  }"},
      {Sample(), L"object", true,
       L"{ \"A\" : [ \"x \"y\"\" ], \"a\" : true, \"b\" : 1.5, \"n\" : null, \"o\" : {  } }"},
  };
  for (const auto& row : rows) {
    EXPECT_STREQ(row.value.TypeName(), row.typeName) << row.text;
    EXPECT_EQ(row.value.IsTrue(), row.isTrue) << row.text;
    EXPECT_EQ(row.value.ToText(), row.text);
  }
  EXPECT_STREQ(Value::TypeName(5), L"object");
  EXPECT_STREQ(Value::TypeName(6), L"unknown");
}

TEST(Value, WrongTypesThrowWithTheExactMessage) {
  Value yes(true);
  Value number(2.5);
  Value array = Value::EmptyArray();
  array.Append(1);
  const Value object = Sample().Member(L"o");
  struct {
    std::function<void()> action;
    const char* message;
  } const rows[] = {
      {[&] { yes.AsNumber(); }, "exception: invalid type [number != bool], [true]"},
      {[&] { number.AsString(); }, "exception: invalid type [string != number], [2.5]"},
      {[&] { Value(L"\u00E9").Size(); }, "exception: invalid type[array|dict != string], [\"\xC3\xA9\"]"},
      {[&] { Value().Size(); }, "exception: invalid type[array|dict != null], [null]"},
      {[&] { object.Element(0); }, "exception: invalid type [array != object], [{  }]"},
      {[&] { array.Member(L"k"); }, "exception: invalid type [dict != array] for [key k], [[ 1 ]]"},
      {[&] { object.Member(L"k"); }, "exception: key not found [k], [{  }]"},
      {[&] { yes.Append(1); }, "exception: invalid type [array != bool], [true]"},
      {[&] { yes.SetMember(L"k", 1); }, "exception: invalid type [dict != bool] for [key k], [true]"},
      {[&] { yes.Keys(); }, "exception: invalid type [dict != bool], [true]"},
      {[&] { Value().HasMember(L"k"); }, "exception: invalid type [dict != null], [null]"},
  };
  for (const auto& row : rows)
    EXPECT_EQ(MessageOf(row.action), row.message);
  EXPECT_TRUE(yes.IsTrue()) << "a failed change leaves the value alone";
}

TEST(Value, MembersKeepTheirOrderAndAreTakenByExactKey) {
  Value value = Sample();
  value.SetMember(L"b", L"again");
  std::wstring keys;
  for (const qx::String& key : value.Keys())
    keys += std::wstring(key);
  EXPECT_EQ(keys, L"bAano");
  EXPECT_TRUE(value.Member(L"b").AsString() == L"again");
  EXPECT_STREQ(value.Member(L"A").TypeName(), L"array");
  EXPECT_STREQ(value.Member(L"a").TypeName(), L"bool");
  EXPECT_TRUE(value.HasMember(L"n"));
  EXPECT_FALSE(value.HasMember(L"N"));
  EXPECT_EQ(value.Size(), 5u);
}

TEST(Value, NullBecomesWhatIsPutIntoIt) {
  Value array;
  array.Append(L"one");
  EXPECT_EQ(array.Size(), 1u);
  EXPECT_TRUE(array.Element(0).AsString() == L"one");
  Value object;
  object.SetMember(L"k", 1);
  EXPECT_EQ(object.Member(L"k").AsNumber(), 1);
}

TEST(Value, CopiesAreDeepAndPartsMayReplaceTheWhole) {
  Value original = Sample();
  Value copy = original;
  copy.Member(L"A").Append(L"more");
  EXPECT_EQ(original.Member(L"A").Size(), 1u);
  EXPECT_EQ(copy.Member(L"A").Size(), 2u);

  original = original.Member(L"A");
  EXPECT_EQ(original.ToText(), L"[ \"x \"y\"\" ]");
  copy = std::move(copy.Member(L"b"));
  EXPECT_EQ(copy.AsNumber(), 1.5);
  copy = Value::EmptyArray();
  copy.Append(copy);
  EXPECT_EQ(copy.ToText(), L"[ [  ] ]");
}

TEST(Value, NodesAreReleasedThroughTheFunctionsTheyCameFrom) {
  g_allocated = g_freed = 0;
  {
    Value array = Value::EmptyArray(kCounted);
    array.Append(Value(1, kCounted));
    array.Append(Value(L"two", kCounted));
    array.Append(Value(true));
    const Value copy = array;
    EXPECT_EQ(g_allocated, 6);
    array.Element(0) = Value();
    EXPECT_EQ(g_freed, 1);
  }
  EXPECT_EQ(g_freed, g_allocated);
  EXPECT_THROW(Value(1.0, kNone), std::bad_alloc);
}

TEST(Value, JsonKeepsEverythingButTheKeyOrder) {
  const Value value = Sample();
  EXPECT_EQ(value.ToJsonText(), "{\"A\":[\"x \\\"y\\\"\"],\"a\":true,\"b\":1.5,\"n\":null,\"o\":{}}\n");
  Json::Value json;
  std::string error;
  ASSERT_TRUE(
      ParseJson("{\"\xC3\xA9\":[-3,18446744073709551615,1e300,false,null,\"\\u0000\xE2\x82\xAC\"]}", json, error));
  const Value read = Value::FromJson(json);
  const Value& list = read.Member(L"\u00E9");
  EXPECT_EQ(list.Element(0).AsNumber(), -3);
  EXPECT_EQ(list.Element(1).AsNumber(), 18446744073709551615.0);
  EXPECT_EQ(list.Element(5).AsString(), std::wstring_view(L"\0\u20AC", 2));
  EXPECT_EQ(Value::FromJson(read.ToJson()).ToText(), read.ToText());
}

TEST(Value, AThousandLevelsAreNoTrouble) {
  Value value;
  for (int level = 0; level < 1000; ++level) {
    Value outer;
    if (level % 2 == 0) {
      outer.Append(std::move(value));
    } else {
      outer.SetMember(L"k", std::move(value));
    }
    value = std::move(outer);
  }
  const Value copy = value;
  EXPECT_EQ(copy.ToText().size(), 500 * 4 + 500 * (4 + 6) + 4u);
  EXPECT_EQ(Value::FromJson(copy.ToJson()).ToText(), value.ToText());
  EXPECT_EQ(copy.ToJsonText().size(), 500 * 2 + 500 * 6 + 5u);
}
