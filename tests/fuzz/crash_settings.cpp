// The settings file of the crash handler, and the names of dumps that it may delete.
#include "companions/crash/crash_settings.h"

#include "companions/crash/dump_name.h"
#include "core/text.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  const auto parsed = crash::ParseSettings(bytes);
  PROMISE(parsed.settings.dumpCount >= 1 && parsed.settings.dumpCount <= crash::kMostDumps);
  PROMISE(!parsed.settings.dumpPath.empty());

  const std::wstring name = ToWide(bytes);
  PROMISE(!crash::IsDumpName(name) || name.ends_with(L".dmp"));
  PROMISE(!crash::IsDumpName(name) || !crash::IsPartialDumpName(name));
}
