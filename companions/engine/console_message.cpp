#include "companions/engine/console_message.h"

#include "companions/engine/value_json.h"
#include "core/text.h"

namespace engine {
namespace {

HtmlSeverity SeverityOf(const std::string& level) {
  if (level == "error" || level == "assert") return HTML_ERROR;
  return level == "warning" ? HTML_WARNING : HTML_INFORMATION;
}

// An object of the script: a plain value, or what the browser makes of anything else.
std::string Describe(const Json::Value& object) {
  const Json::Value& value = MemberOf(object, "value");
  if (value.isString()) return value.asString();
  const std::string description = TextOf(object, "description");
  return !description.empty() || value.isNull() ? description : ToUtf8(ToLiteral(FromWire(value, {})));
}

std::string Place(const Json::Value& details) {
  const std::string url = TextOf(details, "url");
  if (url.empty()) return {};
  return " (" + url + ":" + std::to_string(static_cast<int64_t>(NumberOf(details, "lineNumber")) + 1) + ")";
}

}  // namespace

std::optional<ConsoleMessage> ReadConsoleMessage(const DevToolsMessage& event) {
  const Json::Value& params = event.content;
  if (event.method == "Runtime.consoleAPICalled") {
    std::string text;
    for (const Json::Value& argument : MemberOf(params, "args"))
      text += (text.empty() ? "" : " ") + Describe(argument);
    return ConsoleMessage{HTML_SUBSYSTEM_SCRIPT, SeverityOf(TextOf(params, "type")), ToWide(text)};
  }
  if (event.method == "Runtime.exceptionThrown") {
    const Json::Value& details = MemberOf(params, "exceptionDetails");
    std::string text = Describe(MemberOf(details, "exception"));
    if (text.empty()) text = TextOf(details, "text");
    return ConsoleMessage{HTML_SUBSYSTEM_SCRIPT, HTML_ERROR, ToWide(text + Place(details))};
  }
  if (event.method == "Log.entryAdded") {
    const Json::Value& entry = MemberOf(params, "entry");
    const HtmlSubsystem subsystem =
        TextOf(entry, "source") == "javascript" ? HTML_SUBSYSTEM_SCRIPT : HTML_SUBSYSTEM_DOM;
    return ConsoleMessage{subsystem, SeverityOf(TextOf(entry, "level")), ToWide(TextOf(entry, "text") + Place(entry))};
  }
  return {};
}

}  // namespace engine
