// What a page or the browser has to say to a developer, as the engine's diagnostics. Includes no Windows header of its
// own but for the numbers of the interface.
#pragma once

#include <optional>
#include <string>

#include "companions/engine/devtools_message.h"
#include "interfaces/html_engine.h"

namespace engine {

struct ConsoleMessage {
  HtmlSubsystem subsystem = HTML_SUBSYSTEM_SCRIPT;
  HtmlSeverity severity = HTML_INFORMATION;
  std::wstring text;
};

// Nothing when the event is none of the console's.
std::optional<ConsoleMessage> ReadConsoleMessage(const DevToolsMessage& event);

}  // namespace engine
