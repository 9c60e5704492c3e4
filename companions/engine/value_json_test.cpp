#include "companions/engine/value_json.h"

#include <gtest/gtest.h>

#include <cmath>

#include "core/json.h"

namespace engine {
namespace {

std::string ThroughTheWire(const std::string& json) {
  Json::Value wire;
  std::string error;
  EXPECT_TRUE(ParseJson("[" + json + "]", wire, error)) << error;
  std::string text = WriteCompactJson(ToWire(FromWire(wire[0], {})));
  text.pop_back();
  return text;
}

TEST(WireForm, LosesNothing) {
  for (const char* wire : {"null", "false", "-3", "0.5", "\"a\\\"b\"", "[]", "[1,[\"x\"]]", R"({"m":[]})",
                           R"({"m":["z",1,"a",{"m":["b",[]]}]})", R"({"u":0})", R"({"n":"NaN"})",
                           R"({"n":"-Infinity"})", R"({"d":1.5})", R"({"e":"bad"})", R"({"b":"00ff10"})"}) {
    EXPECT_EQ(ThroughTheWire(wire), wire);
  }
}

TEST(WireForm, WhatItDoesNotKnowIsUndefined) {
  for (const char* wire : {"{}", R"({"x":1})", R"({"m":1})", R"({"m":[],"u":0})", R"({"f":"7"})", R"({"f":-1})",
                           R"({"d":"x"})", R"({"e":1})"}) {
    EXPECT_EQ(ThroughTheWire(wire), R"({"u":0})") << wire;
  }
  EXPECT_EQ(ThroughTheWire(R"({"m":["odd"]})"), R"({"m":[]})");
  EXPECT_EQ(ThroughTheWire(R"({"m":[1,2,"a",3]})"), R"({"m":["a",3]})");
  EXPECT_EQ(ThroughTheWire(R"({"b":"0g"})"), R"({"b":""})");
}

TEST(WireForm, WholeNumbersAreIntegersAsFarAsTheyGo) {
  const auto isInteger = [](const Json::Value& number) { return FromWire(number, {}).As<int32_t>() != nullptr; };
  EXPECT_TRUE(isInteger(2147483647));
  EXPECT_TRUE(isInteger(3.0));
  EXPECT_FALSE(isInteger(Json::Int64{2147483648}));
  EXPECT_TRUE(isInteger(-2147483648.0));
  EXPECT_FALSE(isInteger(0.5));
  const auto minusZero = FromWire(ToWire(ScriptValue(-0.0)), {});
  ASSERT_NE(minusZero.As<double>(), nullptr);
  EXPECT_TRUE(std::signbit(*minusZero.As<double>()));
}

}  // namespace
}  // namespace engine
