#include "systeminfo/installed_updates_collector.h"

#include <string>

#include "core/logging.h"
#include "systeminfo/utils/registry_json.h"
#include "systeminfo/utils/registry_key.h"

namespace systeminfo {
namespace {

constexpr const wchar_t* kUninstallKeys[] = {
    L"Software\\Wow6432Node\\Microsoft\\Windows\\CurrentVersion\\Uninstall",
    L"Software\\Microsoft\\Windows\\CurrentVersion\\Uninstall",
};

// A key that is not there is no error: not every machine has both.
void AppendUpdates(const wchar_t* path, Json::Value& updates) {
  const utils::RegistryKey uninstall(HKEY_LOCAL_MACHINE, path);
  if (!uninstall) uninstall.LogUnlessAbsent(L"systeminfo::InstalledUpdatesCollector::Start", path);
  uninstall.WalkSubkeys([&](const std::wstring& name) {
    const utils::RegistryKey entry = uninstall.OpenSubkey(name);
    if (!entry) {
      LOG_ERROR(L"systeminfo::InstalledUpdatesCollector::Start", L"Failed to open %s\\%s, error %u", path, name.c_str(),
                entry.OpenError());
      return true;
    }
    const Json::Value values = utils::ValuesAsJson(entry);
    if (IsUpdate(values)) updates.append(DescribeUpdate(values));
    return true;
  });
}

}  // namespace

void InstalledUpdatesCollector::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>&,
                                      const std::atomic<bool>* cancel) {
  m_data = Json::Value(Json::arrayValue);
  AppendUpdates(kUninstallKeys[0], m_data);
  if (!IsCancelled(cancel)) AppendUpdates(kUninstallKeys[1], m_data);
}

bool IsUpdate(const Json::Value& values) {
  // What reads the files takes exactly these entries for updates; kept, though hidden programs pass too.
  return !values["displayname"].isNull() && !values["uninstallstring"].isNull() && values["systemcomponent"] == "1";
}

Json::Value DescribeUpdate(const Json::Value& values) {
  constexpr const char* kMembers[][2] = {
      {"Name", "displayname"},
      {"Program", "parentdisplayname"},
      {"InstallDate", "installdate"},
  };
  Json::Value update(Json::objectValue);
  for (const auto& [member, value] : kMembers) {
    if (values.isMember(value)) update[member] = values[value];
  }
  return update;
}

}  // namespace systeminfo
