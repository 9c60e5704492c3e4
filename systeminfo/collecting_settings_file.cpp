// The part of the settings that has to do with the system: reading the file, writing the log.
#include "core/files.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/collecting_settings.h"
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

}  // namespace systeminfo
