#include "systeminfo/settings_document.h"

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

bool IsCollectorEnabled(const Json::Value& document, std::string_view key) {
  if (IsSettingTrue(document, "all_collectors")) return true;
  const Json::Value* value = FindSetting(document, key);
  return value != nullptr && (!value->isBool() || value->asBool());
}

}  // namespace systeminfo
