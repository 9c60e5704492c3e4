// What the settings file says: where log lines go, which of them, and how much is kept. Reads XML text from outside and
// asks the system for nothing; the schema and the defaults are written down in docs/log.md.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "core/log_folder.h"
#include "interfaces/log_constants.h"

namespace logfile {

struct Settings {
  bool enabled = true;
  std::string folder = logging::kDefaultLogFolder;  // UTF-8, as configured: %NAME% not yet expanded
  uint32_t levels = LOG_LEVEL_ALL;
  uint32_t depth = LOG_DEPTH_EXE;
  uint32_t types = LOG_TYPE_FILE;
  uint32_t mode = LOG_MODE_APPEND;
  uint64_t maxBytes = uint64_t{10} << 20;  // of one file; 0: no limit
  uint32_t oldFiles = 5;

  bool operator==(const Settings&) const = default;
};

inline constexpr uint32_t kMostOldFiles = 99;

struct ParsedSettings {
  // None when the text is not XML or its top element is not `configuration`. A single value that cannot be understood
  // is no reason: it gets its default.
  std::optional<Settings> settings;
  std::vector<std::string> problems;  // one sentence each, UTF-8
};
ParsedSettings ParseSettings(std::string_view xml);

// Names joined by "|", in any letter case, with any blanks: "FATAL | ERROR"; also "ALL" and "NONE". Nothing when one of
// the names is unknown or there is none.
std::optional<uint32_t> ParseLevels(std::string_view text);

// A number of bytes, or of "KB", "MB", "GB" (1,024 each).
std::optional<uint64_t> ParseSize(std::string_view text);

}  // namespace logfile
