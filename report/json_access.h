// Reading documents whose shape nobody promises: a member that is missing, null or of another type reads as nothing,
// and never throws. Pure functions; no Windows header.
#pragma once

#include <json/value.h>

#include <optional>
#include <string>
#include <string_view>

namespace report {

// The null value when `value` is no object or has no such member.
const Json::Value& Member(const Json::Value& value, const char* name);

// Empty for what is no text.
std::string TextOf(const Json::Value& value);

// A finite JSON number, or a text that is a decimal whole number, as the collectors write 64-bit ones.
std::optional<double> NumberOf(const Json::Value& value);

// The text, or its beginning and "..." when it is longer than `most` bytes; never cut within a character.
std::string Shortened(std::string_view text, size_t most);

bool IsFalse(const Json::Value& value);  // the JSON value false only: neither null nor 0

// Calls `visit` (element, "[index]") for the elements of an array; for anything else not at all.
template <class Visit>
void ForEachElement(const Json::Value& array, Visit visit) {
  if (!array.isArray()) return;
  for (Json::ArrayIndex i = 0; i < array.size(); ++i)
    visit(array[i], "[" + std::to_string(i) + "]");
}

// The same for the members of an object: `visit` (name, member).
template <class Visit>
void ForEachMember(const Json::Value& object, Visit visit) {
  if (!object.isObject()) return;
  for (auto member = object.begin(); member != object.end(); ++member)
    visit(member.name(), *member);
}

}  // namespace report
