#include "systeminfo/startup_programs_collector.h"

#include "core/files.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "core/text.h"
#include "core/walk_dir.h"
#include "systeminfo/collecting_settings.h"
#include "systeminfo/list_file.h"
#include "systeminfo/settings_document.h"
#include "systeminfo/utils/folder_variables.h"
#include "systeminfo/utils/registry_key.h"

namespace systeminfo {
namespace {

constexpr wchar_t kReadList[] = L"systeminfo::StartupProgramsCollector::ReadList";
constexpr wchar_t kFromRegistry[] = L"systeminfo::StartupProgramsCollector::FromRegistry";
constexpr wchar_t kFromFilesystemPath[] = L"systeminfo::StartupProgramsCollector::FromFilesystemPath";
constexpr uint64_t kLargestListFile = uint64_t{1} << 20;

// Relative paths begin in the current directory, as those of settings files do, or else beside the program, where the
// lists that ship with it lie.
DWORD ReadListFile(const std::wstring& path, std::string& bytes) {
  const DWORD error = ReadWholeFile(path, kLargestListFile, bytes);
  const bool isAbsent = error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND;
  if (!isAbsent || IsAbsolutePath(path)) return error;
  return ReadWholeFile(JoinPath(ProgramFolder(), path), kLargestListFile, bytes);
}

// The entries of the list file that `config` names under `key`. Whatever is wrong is logged, and there are none.
std::vector<std::wstring> ReadList(const Json::Value& config, const char* key, const wchar_t* scope) {
  const Json::Value* setting = FindSetting(config, key);
  if (setting == nullptr || !setting->isString()) {
    LOG_ERROR(scope, L"Expecting a string with file name");
    return {};
  }
  const std::wstring path = ToWide(setting->asString());
  std::string bytes;
  if (const DWORD error = ReadListFile(path, bytes); error != ERROR_SUCCESS) {
    LOG_ERROR(kReadList, L"The list %s cannot be read, error %u", path.c_str(), error);
    return {};
  }
  const ListLines list = ParseListFile(bytes);
  if (!list.isText) LOG_ERROR(kReadList, L"The list %s is not UTF-8 text", path.c_str());
  std::vector<std::wstring> entries;
  for (const std::string& line : list.lines)
    entries.push_back(ToWide(line));
  return entries;
}

}  // namespace

void StartupProgramsCollector::Start(const std::shared_ptr<CollectingSettings>& settings,
                                     const std::shared_ptr<WMIWrapper>&, const std::atomic<bool>* cancel) {
  const Json::Value config = settings->GetValue(m_name);
  FromRegistry(config);
  if (!IsCancelled(cancel)) FromFilesystemPath(config, cancel);
}

void StartupProgramsCollector::FromRegistry(const Json::Value& config) {
  for (const std::wstring& path : ReadList(config, "from_registry_file", kFromRegistry)) {
    const utils::RegistryKey key(path);
    if (!key) {  // most machines have only some of the keys
      key.LogUnlessAbsent(kFromRegistry, path);
      continue;
    }
    for (const utils::RegistryValue& value : key.GetValues()) {
      Json::Value entry(Json::objectValue);
      entry["key"] = ToUtf8(path);
      entry["name"] = ToUtf8(value.name);
      entry["value"] = IsSecretValue(value.name) ? "(withheld)" : ToUtf8(utils::ValueText(value));
      m_data.append(std::move(entry));
    }
  }
}

void StartupProgramsCollector::FromFilesystemPath(const Json::Value& config, const std::atomic<bool>* cancel) {
  for (const std::wstring& listed : ReadList(config, "from_filesystem_path", kFromFilesystemPath)) {
    if (IsCancelled(cancel)) return;
    const std::wstring path = utils::ExpandFolderVariables(listed);
    if (path.starts_with(L"\\\\.\\")) {
      LOG_ERROR(kFromFilesystemPath, L"%s is a device and is passed over", path.c_str());
    } else if (!PathExists(path)) {
      LOG_WARNING(kFromFilesystemPath, L"File %s does not exist", path.c_str());
    } else {
      AppendFiles(path, cancel);
    }
  }
}

void StartupProgramsCollector::AppendFiles(const std::wstring& folder, const std::atomic<bool>* cancel) {
  const bool isListed = WalkDir(folder, [&](const qx::PathString& path, uint32_t attributes) {
    if ((attributes & FILE_ATTRIBUTE_DIRECTORY) == 0) m_data.append(ToUtf8(std::wstring_view(path)));
    return IsCancelled(cancel) ? kWalkStop : kWalkContinue;
  });
  if (!isListed) LOG_WARNING(kFromFilesystemPath, L"%s cannot be listed as a folder", folder.c_str());
}

bool IsSecretValue(const std::wstring& name) {
  return name == L"defaultpassword" || name == L"altdefaultpassword";
}

}  // namespace systeminfo
