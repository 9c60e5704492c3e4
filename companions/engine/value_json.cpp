#include "companions/engine/value_json.h"

#include <charconv>
#include <cmath>
#include <limits>

#include "core/json.h"
#include "core/text.h"

namespace engine {
namespace {

Json::Value Tagged(const char* tag, Json::Value content) {
  Json::Value wire(Json::objectValue);
  wire[tag] = std::move(content);
  return wire;
}

std::string ToHex(const std::string& bytes) {
  static constexpr char kDigits[] = "0123456789abcdef";
  std::string hex;
  hex.reserve(bytes.size() * 2);
  for (const char c : bytes) {
    hex += kDigits[static_cast<unsigned char>(c) >> 4];
    hex += kDigits[static_cast<unsigned char>(c) & 15];
  }
  return hex;
}

std::string FromHex(const std::string& hex) {
  std::string bytes;
  for (size_t i = 0; i + 1 < hex.size(); i += 2) {
    unsigned value = 0;
    if (std::from_chars(&hex[i], &hex[i] + 2, value, 16).ptr != &hex[i] + 2) return {};
    bytes += static_cast<char>(value);
  }
  return bytes;
}

// The wire form of each kind of data.
struct WireWriter {
  Json::Value operator()(Undefined) const { return Tagged("u", 0); }
  Json::Value operator()(Null) const { return {}; }
  Json::Value operator()(bool data) const { return data; }
  Json::Value operator()(int32_t data) const { return data; }
  Json::Value operator()(double data) const {
    if (std::isfinite(data)) return data;
    return Tagged("n", std::isnan(data) ? "NaN" : data > 0 ? "Infinity" : "-Infinity");
  }
  Json::Value operator()(const Text& data) const {
    return data.isError ? Tagged("e", ToUtf8(data.text)) : Json::Value(ToUtf8(data.text));
  }
  Json::Value operator()(Date data) const {
    return std::isfinite(data.milliseconds) ? Tagged("d", data.milliseconds) : Tagged("u", 0);
  }
  Json::Value operator()(const Bytes& data) const { return Tagged("b", ToHex(data.bytes)); }
  Json::Value operator()(const std::shared_ptr<ScriptValue::Array>& data) const {
    Json::Value wire(Json::arrayValue);
    for (const ScriptValue& element : *data)
      wire.append(ToWire(element));
    return wire;
  }
  Json::Value operator()(const std::shared_ptr<ScriptValue::Map>& data) const {
    Json::Value entries(Json::arrayValue);
    for (const auto& [key, value] : *data) {
      entries.append(ToUtf8(ToPlainText(key)));
      entries.append(ToWire(value));
    }
    return Tagged("m", std::move(entries));
  }
  Json::Value operator()(const ScriptValue::Function& data) const { return Tagged("f", Json::UInt64{data->Id()}); }
};

// The plain literal of each kind of data.
struct LiteralWriter {
  Json::Value operator()(Undefined) const { return {}; }
  Json::Value operator()(Null) const { return {}; }
  Json::Value operator()(bool data) const { return data; }
  Json::Value operator()(int32_t data) const { return data; }
  Json::Value operator()(double data) const { return std::isfinite(data) ? Json::Value(data) : Json::Value(); }
  Json::Value operator()(const Text& data) const { return ToUtf8(data.text); }
  Json::Value operator()(Date data) const { return (*this)(data.milliseconds); }
  Json::Value operator()(const Bytes& data) const { return ToHex(data.bytes); }
  Json::Value operator()(const std::shared_ptr<ScriptValue::Array>& data) const {
    Json::Value literal(Json::arrayValue);
    for (const ScriptValue& element : *data)
      literal.append(std::visit(*this, element.Get()));
    return literal;
  }
  Json::Value operator()(const std::shared_ptr<ScriptValue::Map>& data) const {
    Json::Value literal(Json::objectValue);
    for (const auto& [key, value] : *data)
      literal[ToUtf8(ToPlainText(key))] = std::visit(*this, value.Get());
    return literal;
  }
  Json::Value operator()(const ScriptValue::Function&) const { return {}; }
};

ScriptValue Number(double number) {
  // -0 is a float: as an integer it would lose its sign.
  const bool isWhole = number >= std::numeric_limits<int32_t>::min() && number <= std::numeric_limits<int32_t>::max() &&
                       number == std::floor(number) && !(number == 0 && std::signbit(number));
  return isWhole ? ScriptValue(static_cast<int32_t>(number)) : ScriptValue(number);
}

double NamedNumber(const std::string& name) {
  if (name == "Infinity") return std::numeric_limits<double>::infinity();
  if (name == "-Infinity") return -std::numeric_limits<double>::infinity();
  if (name == "-0") return -0.0;
  return std::numeric_limits<double>::quiet_NaN();
}

ScriptValue TaggedFromWire(const std::string& tag, const Json::Value& content,
                           const std::weak_ptr<FunctionHome>& home) {
  if (tag == "m" && content.isArray()) {
    ScriptValue::Map map;
    for (Json::ArrayIndex i = 0; i + 1 < content.size(); i += 2) {
      if (content[i].isString()) {
        map.emplace_back(ScriptValue(Text{ToWide(content[i].asString())}), FromWire(content[i + 1], home));
      }
    }
    return ScriptValue::Of(std::move(map));
  }
  if (tag == "f" && content.isUInt64()) {
    return ScriptValue(ScriptValue::Function(std::make_shared<ScriptFunction>(home, content.asUInt64())));
  }
  if (tag == "d" && content.isNumeric()) return ScriptValue(Date{content.asDouble()});
  if (!content.isString()) return {};
  if (tag == "n") return ScriptValue(NamedNumber(content.asString()));
  if (tag == "e") return ScriptValue::Error(ToWide(content.asString()));
  if (tag == "b") return ScriptValue(Bytes{FromHex(content.asString())});
  return {};
}

ScriptValue FromPlainJson(const Json::Value& json) {
  if (json.isArray()) {
    ScriptValue::Array array;
    for (const Json::Value& element : json)
      array.push_back(FromPlainJson(element));
    return ScriptValue::Of(std::move(array));
  }
  if (!json.isObject()) return FromWire(json, {});
  ScriptValue::Map map;
  for (auto member = json.begin(); member != json.end(); ++member)
    map.emplace_back(ScriptValue(Text{ToWide(member.name())}), FromPlainJson(*member));
  return ScriptValue::Of(std::move(map));
}

}  // namespace

Json::Value ToWire(const ScriptValue& value) {
  return std::visit(WireWriter(), value.Get());
}

ScriptValue FromWire(const Json::Value& wire, const std::weak_ptr<FunctionHome>& home) {
  switch (wire.type()) {
    case Json::nullValue:
      return ScriptValue(Null());
    case Json::booleanValue:
      return ScriptValue(wire.asBool());
    case Json::intValue:
    case Json::uintValue:
    case Json::realValue:
      return Number(wire.asDouble());
    case Json::stringValue:
      return ScriptValue(Text{ToWide(wire.asString())});
    case Json::arrayValue: {
      ScriptValue::Array array;
      for (const Json::Value& element : wire)
        array.push_back(FromWire(element, home));
      return ScriptValue::Of(std::move(array));
    }
    case Json::objectValue:
      return wire.size() == 1 ? TaggedFromWire(wire.begin().name(), *wire.begin(), home) : ScriptValue();
  }
  return {};
}

std::wstring ToPlainText(const ScriptValue& value) {
  if (const Text* text = value.As<Text>()) return text->text;
  if (value.As<Undefined>() != nullptr) return L"undefined";
  return ToLiteral(value);
}

std::wstring ToLiteral(const ScriptValue& value) {
  std::string json = WriteCompactJson(std::visit(LiteralWriter(), value.Get()));
  if (json.ends_with('\n')) json.pop_back();
  return ToWide(json);
}

bool FromLiteral(std::wstring_view text, ScriptValue& value) {
  Json::Value json;
  std::string error;
  // The reader takes documents only; a number or text alone is an element of one.
  if (!ParseJson("[" + ToUtf8(text) + "\n]", json, error) || !json.isArray() || json.size() != 1) return false;
  value = FromPlainJson(json[0]);
  return true;
}

ScriptValue FromPlainText(std::wstring_view text) {
  if (text == L"undefined") return {};
  if (text == L"null") return ScriptValue(Null());
  if (text == L"true" || text == L"false") return ScriptValue(text == L"true");
  const std::string utf8 = ToUtf8(text);
  double number = 0;
  const auto [end, error] = std::from_chars(utf8.data(), utf8.data() + utf8.size(), number);
  const bool isNumber = error == std::errc() && end == utf8.data() + utf8.size() && std::isfinite(number);
  return isNumber ? Number(number) : ScriptValue(Text{std::wstring(text)});
}

}  // namespace engine
