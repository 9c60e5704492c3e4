// Rules over the collection-settings document, a JSON object that says where the output goes, how it is written and
// which collectors run. Pure functions over bytes and Json::Value: what a user may write into that file is decided here
// and nowhere else. Keys are UTF-8 and compared exactly.
#pragma once

#include <json/value.h>

#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace systeminfo {

// A longer settings file is refused unread.
inline constexpr uint64_t kLargestSettingsFile = uint64_t{16} << 20;

// Parses a settings file. Comments and a UTF-8 byte-order mark are accepted. False when the bytes are not UTF-8 JSON,
// or the root is not an object; `error` then says why, and `document` keeps its value.
bool ParseSettingsDocument(std::string_view bytes, Json::Value& document, std::string& error);

// The member `key`, or null (the pointer) when it is absent or `document` is not an object. A member whose value is
// JSON null is present.
const Json::Value* FindSetting(const Json::Value& document, std::string_view key);

// True only when the member exists and is boolean true.
bool IsSettingTrue(const Json::Value& document, std::string_view key);

inline constexpr std::chrono::seconds kDefaultCollectorTimeout = std::chrono::minutes(10);
inline constexpr std::chrono::seconds kLongestCollectorTimeout = std::chrono::hours(24 * 7);

// How long one collector may take: the member "collector_timeout", in seconds, 0 for as long as it takes. The default
// when there is no such member; nothing when it is no number from 0 to the longest.
std::optional<std::chrono::milliseconds> CollectorTimeout(const Json::Value& document);

// Whether the collector of the settings key `key` runs. Loose on purpose, so that a key can carry the collector's own
// parameters instead of true: any value but boolean false enables it, null included. "all_collectors", when boolean
// true, beats everything.
bool IsCollectorEnabled(const Json::Value& document, std::string_view key);

}  // namespace systeminfo
