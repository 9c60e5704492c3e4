#include "stutil/raised_logging.h"

#include <json/value.h>

#include <algorithm>

#include "core/json.h"

namespace stutil {
namespace {

constexpr char kComponents[] = "components";
constexpr char kName[] = "name";
constexpr char kLevel[] = "level";
constexpr char kLoggerXmlBytes[] = "logger_xml_bytes";

bool ReadComponents(const Json::Value& components, std::vector<ComponentLevel>& result) {
  if (!components.isArray()) return false;
  for (const Json::Value& component : components) {
    if (!component.isObject() || !component[kName].isString() || !component[kLevel].isUInt()) return false;
    result.push_back({component[kName].asString(), component[kLevel].asUInt()});
  }
  return true;
}

// Names come from other programs and may be any bytes; JSON is UTF-8.
std::string Printable(std::string name) {
  std::replace_if(
      name.begin(), name.end(), [](char c) { return c < ' ' || c > '~'; }, '?');
  return name;
}

}  // namespace

uint32_t FormerLevel(const RaisedLogging& former, size_t index, const std::string& name) {
  if (index >= former.components.size() || Printable(former.components[index].name) != Printable(name)) return 0;
  return former.components[index].level;
}

std::string WriteRaisedLogging(const RaisedLogging& former) {
  Json::Value header(Json::objectValue);
  header[kComponents] = Json::Value(Json::arrayValue);
  for (const ComponentLevel& component : former.components) {
    Json::Value entry(Json::objectValue);
    entry[kName] = Printable(component.name);
    entry[kLevel] = component.level;
    header[kComponents].append(entry);
  }
  if (former.loggerXml) header[kLoggerXmlBytes] = static_cast<Json::UInt64>(former.loggerXml->size());
  return WriteCompactJson(header) + former.loggerXml.value_or(std::string());
}

std::optional<RaisedLogging> ReadRaisedLogging(std::string_view bytes) {
  const size_t lineEnd = bytes.find('\n');
  if (lineEnd == std::string_view::npos) return std::nullopt;
  Json::Value header;
  std::string error;
  if (!ParseJson(bytes.substr(0, lineEnd), header, error) || !header.isObject()) return std::nullopt;
  RaisedLogging former;
  if (!ReadComponents(header[kComponents], former.components)) return std::nullopt;
  if (header.isMember(kLoggerXmlBytes)) {
    const std::string_view loggerXml = bytes.substr(lineEnd + 1);
    // A file that was cut short must not be taken for the configuration.
    if (!header[kLoggerXmlBytes].isUInt64() || header[kLoggerXmlBytes].asUInt64() != loggerXml.size()) {
      return std::nullopt;
    }
    former.loggerXml = loggerXml;
  }
  return former;
}

}  // namespace stutil
