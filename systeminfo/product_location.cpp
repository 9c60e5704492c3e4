#include "systeminfo/product_location.h"

#include "core/logging.h"
#include "core/paths.h"
#include "core/text.h"
#include "systeminfo/utils/registry_json.h"
#include "systeminfo/utils/registry_key.h"

namespace systeminfo {
namespace {

constexpr char kPublisher[] = "Quorvex";

std::wstring LocationOf(const Json::Value& values) {
  const Json::Value& location = values["installlocation"];
  return location.isString() ? ToWide(location.asString()) : std::wstring();
}

}  // namespace

std::wstring GetProductInstallLocation() {
  constexpr wchar_t kScope[] = L"systeminfo::GetProductInstallLocation";
  const utils::RegistryKey uninstall(HKEY_LOCAL_MACHINE, L"Software\\Microsoft\\Windows\\CurrentVersion\\Uninstall");
  std::wstring location;
  if (!uninstall) {
    LOG_ERROR(kScope, L"Could not find Installed product uninstall key in registry");
    uninstall.LogUnlessAbsent(kScope, L"the uninstall key");
    return location;
  }
  uninstall.WalkSubkeys([&](const std::wstring& name) {
    const Json::Value values = utils::ValuesAsJson(uninstall.OpenSubkey(name));
    switch (ClassifyUninstallEntry(values)) {
      case UninstallEntry::kOther:
        break;
      case UninstallEntry::kProductWithoutLocation:
        LOG_WARNING(kScope, L"Found key with publisher QX, but no install location");
        break;
      case UninstallEntry::kProduct:
        location = LocationOf(values);
        LOG_TRACE(kScope, L"installLocation %s", location.c_str());
        return false;
    }
    return true;
  });
  return location;
}

UninstallEntry ClassifyUninstallEntry(const Json::Value& values) {
  if (values["publisher"] != kPublisher) return UninstallEntry::kOther;
  return IsAbsolutePath(LocationOf(values)) ? UninstallEntry::kProduct : UninstallEntry::kProductWithoutLocation;
}

}  // namespace systeminfo
