// Which folder a logger configuration means: one rule for the logging library, which writes there, and for the program,
// which reports and packs it. No Windows header.
#pragma once

#include <string>
#include <string_view>

namespace tinyxml2 {
class XMLElement;
}

namespace logging {

// The folder when a configuration names none.
inline constexpr char kDefaultLogFolder[] = "%LOCALAPPDATA%\\Quorvex\\SupportTool\\Logs";

// The text of "path" under the element `configuration` (an attribute, else a child element; UTF-8, without blanks
// around it), not yet expanded. kDefaultLogFolder when there is none or it is empty.
std::string ConfiguredLogFolder(const tinyxml2::XMLElement& configuration);

// The full path that a configured folder means: a relative one lies under `settingsFolder`. Environment variables have
// been expanded by the caller (ExpandEnvironment in core/files.h).
std::wstring ResolveLogFolder(std::wstring_view folder, std::wstring_view settingsFolder);

}  // namespace logging
