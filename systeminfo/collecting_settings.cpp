#include "systeminfo/collecting_settings.h"

#include "core/files.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/settings_document.h"

namespace systeminfo {
namespace {

constexpr wchar_t kLoadFromFile[] = L"systeminfo::CollectingSettings::LoadFromFile";
constexpr wchar_t kDefaultFile[] = L"defaultCollectSystemInfoConfig.json";

// A file that is simply not there needs no more words than its caller's; any other failure is worth its error code.
DWORD ReadSettingsFile(const std::wstring& path, std::string& bytes) {
  const DWORD error = ReadWholeFile(path, kLargestSettingsFile, bytes);
  if (error != ERROR_SUCCESS && error != ERROR_FILE_NOT_FOUND && error != ERROR_PATH_NOT_FOUND) {
    LOG_ERROR(kLoadFromFile, L"Failed to read %s, error %u", path.c_str(), error);
  }
  return error;
}

}  // namespace

bool CollectingSettings::LoadFromFile(const std::wstring& path) {
  std::string bytes;
  DWORD error = ReadSettingsFile(path, bytes);
  if (error != ERROR_SUCCESS && error != ERROR_FILE_TOO_LARGE) {
    LOG_WARNING(kLoadFromFile, L"No config file with name %s found", path.c_str());
    error = ReadSettingsFile(kDefaultFile, bytes);
    if (error != ERROR_SUCCESS) LOG_ERROR(kLoadFromFile, L"No default config file was found");
  }
  if (error != ERROR_SUCCESS) return false;

  std::string message;
  if (ParseSettingsDocument(bytes, m_document, message)) return true;
  LOG_ERROR(kLoadFromFile, L"%s", ToWide(message).c_str());
  return false;
}

void CollectingSettings::Print() const {
  LOG_TRACE(L"systeminfo::CollectingSettings::Print", L"%s", ToWide(WriteStyledJson(m_document)).c_str());
}

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
