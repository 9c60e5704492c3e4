#include "systeminfo/collecting_settings.h"

#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/settings_document.h"

namespace systeminfo {

bool CollectingSettings::HasKey(std::wstring_view key) const {
  return FindSetting(m_document, ToUtf8(key)) != nullptr;
}

Json::Value CollectingSettings::GetValue(std::wstring_view key) const {
  const Json::Value* value = FindSetting(m_document, ToUtf8(key));
  return value == nullptr ? Json::Value() : *value;
}

void CollectingSettings::SetValue(std::wstring_view key, const Json::Value& value) {
  m_document[ToUtf8(key)] = value;  // the document is an object or null, which becomes an object
}

bool CollectingSettings::IsTrue(std::wstring_view key) const {
  return IsSettingTrue(m_document, ToUtf8(key));
}

std::chrono::milliseconds CollectingSettings::GetCollectorTimeout() const {
  if (const auto timeout = CollectorTimeout(m_document)) return *timeout;
  LOG_ERROR(L"systeminfo::CollectingSettings::GetCollectorTimeout",
            L"collector_timeout is no number of seconds from 0 to %u; %u are taken",
            static_cast<unsigned>(kLongestCollectorTimeout.count()),
            static_cast<unsigned>(kDefaultCollectorTimeout.count()));
  return kDefaultCollectorTimeout;
}

OutputFolderStatus CollectingSettings::GetOutputFolderValue(std::wstring& out) const {
  const Json::Value* value = FindSetting(m_document, "output_folder");
  if (value == nullptr) return OutputFolderStatus::kAbsent;
  if (!value->isString()) return OutputFolderStatus::kNotString;
  out = ToWide(value->asString());
  return OutputFolderStatus::kFound;
}

}  // namespace systeminfo
