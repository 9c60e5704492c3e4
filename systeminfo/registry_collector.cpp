#include "systeminfo/registry_collector.h"

#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/collecting_settings.h"
#include "systeminfo/utils/registry_json.h"

namespace systeminfo {
namespace {

constexpr wchar_t kStart[] = L"systeminfo::RegistryCollector::Start";

}  // namespace

void RegistryCollector::Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>&,
                              const std::atomic<bool>* cancel) {
  const Json::Value paths = settings->GetValue(m_name);
  if (!paths.isArray() && !paths.isObject()) {
    LOG_TRACE(kStart, L"No registry keys to query found");
    return;
  }
  for (const Json::Value& path : paths) {
    if (IsCancelled(cancel)) return;
    if (!path.isString()) {
      LOG_WARNING(kStart, L"registry key is not a string. skipping");
      continue;
    }
    const std::wstring wide = ToWide(path.asString());
    const ::utils::RegistryKey key(wide);
    if (!key) {
      LOG_ERROR(kStart, L"%s is not a valid registry key", wide.c_str());
      LOG_ERROR(kStart, L"error %u", key.OpenError());
      continue;
    }
    Json::Value dump = ::utils::DumpKey(key, cancel);
    m_data[path.asString()].swap(dump);
  }
}

}  // namespace systeminfo
