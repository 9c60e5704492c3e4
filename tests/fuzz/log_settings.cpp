// The settings file of the logging library.
#include "companions/log/log_settings.h"

#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  const auto parsed = logfile::ParseSettings(bytes);
  PROMISE(parsed.settings || !parsed.problems.empty());
  if (parsed.settings) {
    PROMISE((parsed.settings->levels & ~LOG_LEVEL_ALL) == 0);
    PROMISE(parsed.settings->oldFiles <= logfile::kMostOldFiles);
    PROMISE(!parsed.settings->folder.empty());
  }
  logfile::ParseLevels(bytes);
  logfile::ParseSize(bytes);
}
