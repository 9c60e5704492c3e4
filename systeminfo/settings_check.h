// Finds settings keys that somebody wrote and that do nothing: a mistyped collector stays silently off otherwise. Pure
// functions over the settings document; text is UTF-8.
#pragma once

#include <json/value.h>

#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace systeminfo {

struct UnknownKey {
  std::string key;
  std::string nearest;  // the known key that was probably meant; empty when none is close
};

// The members of `document` that are not boolean false and name neither one of `collectorKeys` nor a setting of the run
// itself, in the order of their keys.
std::vector<UnknownKey> FindUnknownKeys(const Json::Value& document, std::span<const std::string> collectorKeys);

// The candidate that differs from `key` by at most two edits (EditDistance);
// the first of the nearest ones, or empty.
std::string NearestKey(std::string_view key, std::span<const std::string> candidates);

}  // namespace systeminfo
