#include "systeminfo/settings_document.h"

#include <cmath>

#include "core/json.h"

namespace systeminfo {

bool ParseSettingsDocument(std::string_view bytes, Json::Value& document, std::string& error) {
  if (bytes.starts_with("\xFF\xFE") || bytes.starts_with("\xFE\xFF")) {
    error = "The settings are UTF-16 text; they must be saved as UTF-8";
    return false;
  }
  Json::Value parsed;
  if (!ParseJson(bytes, parsed, error)) return false;
  if (!parsed.isObject()) {
    error = "The settings must be a JSON object";
    return false;
  }
  document.swap(parsed);
  return true;
}

const Json::Value* FindSetting(const Json::Value& document, std::string_view key) {
  return document.isObject() ? document.find(key.data(), key.data() + key.size()) : nullptr;
}

bool IsSettingTrue(const Json::Value& document, std::string_view key) {
  const Json::Value* value = FindSetting(document, key);
  return value != nullptr && value->isBool() && value->asBool();
}

std::optional<std::chrono::milliseconds> CollectorTimeout(const Json::Value& document) {
  const Json::Value* const member = FindSetting(document, "collector_timeout");
  if (member == nullptr) return kDefaultCollectorTimeout;
  if (!member->isNumeric() || member->isBool()) return std::nullopt;
  const double seconds = member->asDouble();
  if (!(seconds >= 0 && seconds <= static_cast<double>(kLongestCollectorTimeout.count()))) return std::nullopt;
  constexpr int kMilliseconds = 1000;
  return std::chrono::milliseconds(static_cast<int64_t>(std::ceil(seconds * kMilliseconds)));  // only 0 becomes 0
}

bool IsCollectorEnabled(const Json::Value& document, std::string_view key) {
  if (IsSettingTrue(document, "all_collectors")) return true;
  const Json::Value* value = FindSetting(document, key);
  return value != nullptr && (!value->isBool() || value->asBool());
}

}  // namespace systeminfo
