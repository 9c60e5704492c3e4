// A collection-settings file.
#include <array>

#include "core/json.h"
#include "systeminfo/settings_check.h"
#include "systeminfo/settings_document.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  static const std::array<std::string, 3> s_collectors = {"processor", "storage", "windows_events"};
  Json::Value document("as it was");
  std::string error;
  if (!systeminfo::ParseSettingsDocument(bytes, document, error)) {
    PROMISE(!error.empty());
    PROMISE(document == Json::Value("as it was"));
    return;
  }
  PROMISE(document.isObject());
  for (const std::string& collector : s_collectors) {
    PROMISE(!systeminfo::IsSettingTrue(document, collector) || systeminfo::IsCollectorEnabled(document, collector));
  }
  for (const auto& unknown : systeminfo::FindUnknownKeys(document, s_collectors)) {
    PROMISE(document.isMember(unknown.key));
    PROMISE(unknown.nearest.empty() || unknown.nearest != unknown.key);
  }
}
