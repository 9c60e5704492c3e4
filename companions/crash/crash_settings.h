// The settings of the crash handler, as `qxch.xml` beside the library says them. Plain text in, plain values out; an
// element that is missing or makes no sense leaves its default, with a line that says so.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace crash {

struct Settings {
  std::string dumpPath = "%LOCALAPPDATA%\\Quorvex\\SupportTool\\Dumps";  // UTF-8, as written: variables not expanded
  uint32_t dumpCount = 5;                                                // dumps kept, 1 to kMostDumps
};

inline constexpr uint32_t kMostDumps = 1000;

struct ParsedSettings {
  Settings settings;
  std::vector<std::string> problems;  // UTF-8, one log line each
};

ParsedSettings ParseSettings(std::string_view xml);

}  // namespace crash
