#include <gtest/gtest.h>
#include <json/writer.h>

#include <limits>
#include <random>

#include "core/json.h"

namespace {

// The library's writers define both layouts; the build silences their deprecation for this file.
void ExpectTheLibrarysText(const Json::Value& value) {
  ASSERT_EQ(WriteStyledJson(value), Json::StyledWriter().write(value));
  ASSERT_EQ(WriteCompactJson(value), Json::FastWriter().write(value));
}

class RandomDocument {
 public:
  explicit RandomDocument(unsigned seed) : m_random(seed) {}

  Json::Value Whole() { return Below(2) == 0 ? MakeArray(4) : MakeObject(4); }

 private:
  Json::Value Make(int levels) {
    const unsigned kind = Below(levels > 0 ? 9 : 7);
    if (kind == 7) return MakeArray(levels);
    if (kind == 8) return MakeObject(levels);
    switch (kind) {
      case 0:
        return {};
      case 1:
        return static_cast<Json::Int64>(m_random()) << Below(40) >> Below(60);
      case 2:
        return static_cast<Json::UInt64>(m_random()) << Below(40);
      case 3:
        return static_cast<double>(m_random()) / (1 + Below(1000)) - 1e6;
      case 4:
        return Below(2) == 0;
      default:
        return Text();
    }
  }

  unsigned Below(unsigned limit) { return static_cast<unsigned>(m_random() % limit); }

  std::string Text() {
    static const char* const kParts[] = {"plain text",   "\"",
                                         "\\",           "/",
                                         "\r\n",         "\t\b\f",
                                         "\x01\x1F\x7F", "\xC3\xA4",
                                         "\xE6\x9D\xB1", "\xF0\x9F\x98\x80",
                                         "%1",           "\xC3",
                                         "\xFF",         "\xED\xA0\x80",
                                         "\xC0\x80",     "\xF4\x90\x80\x80",
                                         "\x80",         "a"};
    std::string text;
    for (unsigned count = Below(6); count > 0; --count)
      text += kParts[Below(Below(3) == 0 ? std::size(kParts) : 11)];
    if (Below(20) == 0) text += '\0';
    return text;
  }

  Json::Value MakeArray(int levels) {
    Json::Value array(Json::arrayValue);
    const bool isSimple = Below(2) == 0;
    for (unsigned count = Below(30); count > 0; --count)
      array.append(Make(isSimple ? 0 : levels - 1));
    if (Below(10) == 0) array[array.size() + Below(3)] = 1;  // leaves elements that were never set
    return array;
  }

  Json::Value MakeObject(int levels) {
    Json::Value object(Json::objectValue);
    for (unsigned count = Below(6); count > 0; --count)
      object[Text()] = Make(levels - 1);
    return object;
  }

  std::mt19937 m_random;
};

}  // namespace

TEST(WriteJson, TextIsTheLibrarysForRandomDocuments) {
  for (unsigned seed = 1; seed <= 2000 && !testing::Test::HasFatalFailure(); ++seed) {
    SCOPED_TRACE(seed);
    ExpectTheLibrarysText(RandomDocument(seed).Whole());
  }
}

TEST(WriteJson, TextIsTheLibrarysAroundTheMarginAndAtTheEndsOfNumbers) {
  for (size_t length = 0; length < 80; ++length) {
    Json::Value array;
    array.append(std::string(length, 'x'));
    ExpectTheLibrarysText(array);
    array.append(Json::Value(Json::objectValue));
    ExpectTheLibrarysText(array);
  }
  for (Json::ArrayIndex count = 0; count < 30; ++count) {
    Json::Value array(Json::arrayValue);
    array.resize(count);
    ExpectTheLibrarysText(array);
  }
  Json::Value numbers;
  for (const double real : {0.0, -0.0, 0.1, 1e300, -1e-300, 5e-324, std::numeric_limits<double>::infinity(),
                            -std::numeric_limits<double>::infinity(), std::numeric_limits<double>::quiet_NaN()})
    numbers.append(real);
  numbers.append(Json::Value::minLargestInt);
  numbers.append(Json::Value::maxLargestInt);
  numbers.append(Json::Value::maxLargestUInt);
  ExpectTheLibrarysText(numbers);
}

TEST(WriteJson, SinkGetsTheTextInPiecesUntilItHasEnough) {
  Json::Value document;
  for (int i = 0; i < 20'000; ++i)
    document["list"][i]["name"] = "entry " + std::to_string(i);
  const auto check = [&](void (*write)(const Json::Value&, const JsonSink&), const std::string& whole) {
    std::string text;
    size_t longest = 0;
    write(document, [&](std::string_view piece) {
      longest = std::max(longest, piece.size());
      text += piece;
      return true;
    });
    EXPECT_EQ(text, whole);
    EXPECT_LT(longest, size_t{80} << 10);

    int calls = 0;
    write(document, [&calls](std::string_view) { return ++calls < 2; });
    EXPECT_EQ(calls, 2);
  };
  check(WriteStyledJson, WriteStyledJson(document));
  check(WriteCompactJson, WriteCompactJson(document));
}
