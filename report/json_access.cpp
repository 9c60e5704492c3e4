#include "report/json_access.h"

#include <charconv>
#include <cmath>
#include <cstdint>

namespace report {

const Json::Value& Member(const Json::Value& value, const char* name) {
  return value.isObject() ? value[name] : Json::Value::nullSingleton();
}

std::string TextOf(const Json::Value& value) {
  return value.isString() ? value.asString() : std::string();
}

std::optional<double> NumberOf(const Json::Value& value) {
  if (value.isNumeric()) {
    const double number = value.asDouble();
    return std::isfinite(number) ? std::optional(number) : std::nullopt;
  }
  const std::string text = TextOf(value);
  int64_t number = 0;
  const char* const end = text.data() + text.size();
  const auto [stop, error] = std::from_chars(text.data(), end, number);
  if (error != std::errc() || stop != end) return std::nullopt;
  return static_cast<double>(number);
}

std::string Shortened(std::string_view text, size_t most) {
  if (text.size() <= most) return std::string(text);
  size_t end = most;
  while (end > 0 && (static_cast<unsigned char>(text[end]) & 0xC0) == 0x80)
    --end;
  return std::string(text.substr(0, end)) + "...";
}

bool IsFalse(const Json::Value& value) {
  return value.isBool() && !value.asBool();
}

}  // namespace report
