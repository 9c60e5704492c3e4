#include "systeminfo/installed_software_collector.h"

#include "systeminfo/utils/registry_json.h"
#include "systeminfo/utils/registry_key.h"

namespace systeminfo {
namespace {

constexpr wchar_t kStart[] = L"systeminfo::InstalledSoftwareCollector::Start";

constexpr const wchar_t* kLocations[] = {
    L"HKEY_LOCAL_MACHINE\\Software\\Wow6432Node\\Microsoft\\Windows\\CurrentVersion\\Uninstall",
    L"HKEY_LOCAL_MACHINE\\Software\\Microsoft\\Windows\\CurrentVersion\\Uninstall",
    L"HKEY_CURRENT_USER\\Software\\Microsoft\\Windows\\CurrentVersion\\Uninstall",
};

struct Fact {
  const char* member;
  const char* valueName;
};
constexpr Fact kFacts[] = {
    {"Name", "displayname"},
    {"Version", "displayversion"},
    {"Publisher", "publisher"},
    {"InstallDate", "installdate"},
};

void AppendPrograms(const utils::RegistryKey& location, Json::Value& programs) {
  location.WalkSubkeys([&](const std::wstring& name) {
    const utils::RegistryKey entry = location.OpenSubkey(name);
    if (!entry) entry.LogUnlessAbsent(kStart, name);
    const Json::Value values = utils::ValuesAsJson(entry);
    if (IsInstalledProgram(values)) programs.append(InstalledProgram(values));
    return true;
  });
}

}  // namespace

void InstalledSoftwareCollector::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>&,
                                       const std::atomic<bool>* cancel) {
  m_data = Json::Value(Json::arrayValue);
  for (const wchar_t* location : kLocations) {
    const utils::RegistryKey key(location);
    if (!key) key.LogUnlessAbsent(kStart, location);
    AppendPrograms(key, m_data);
    if (IsCancelled(cancel)) return;
  }
}

bool IsInstalledProgram(const Json::Value& values) {
  if (!values.isMember("displayname") || !values.isMember("uninstallstring")) return false;
  if (values.isMember("parentkeyname")) return false;
  if (values.isMember("systemcomponent") && values["systemcomponent"] != "0") return false;
  const Json::Value& releaseType = values["releasetype"];
  return releaseType != "Hotfix" && releaseType != "Service Pack";
}

Json::Value InstalledProgram(const Json::Value& values) {
  Json::Value program(Json::objectValue);
  for (const Fact& fact : kFacts)
    program[fact.member] = values[fact.valueName];
  return program;
}

}  // namespace systeminfo
