#include "companions/log/log_settings.h"

#include <tinyxml2.h>

#include <charconv>
#include <limits>
#include <span>

#include "core/ascii.h"
#include "core/text.h"

namespace logfile {
namespace {

struct Word {
  std::string_view name;
  uint32_t value;
};

constexpr Word kLevels[] = {
    {"FATAL", LOG_LEVEL_FATAL}, {"CRITICAL", LOG_LEVEL_CRITICAL},
    {"ERROR", LOG_LEVEL_ERROR}, {"WARNING", LOG_LEVEL_WARNING},
    {"INFO", LOG_LEVEL_INFO},   {"TRACE", LOG_LEVEL_TRACE},
    {"ALL", LOG_LEVEL_ALL},     {"NONE", 0},
};
constexpr Word kDepths[] = {{"EXE", LOG_DEPTH_EXE}, {"MODULE", LOG_DEPTH_MODULE}};
constexpr Word kTypes[] = {{"FILE", LOG_TYPE_FILE}, {"DEBUGGER", LOG_TYPE_DEBUGGER}};
constexpr Word kModes[] = {{"APPEND", LOG_MODE_APPEND}, {"OVERWRITE", LOG_MODE_OVERWRITE}};
constexpr Word kSwitch[] = {{"true", 1}, {"false", 0}};
constexpr Word kUnits[] = {{"", 0}, {"B", 0}, {"KB", 10}, {"MB", 20}, {"GB", 30}};

std::optional<uint32_t> ParseWord(std::string_view text, std::span<const Word> words) {
  for (const Word& word : words) {
    if (EqualIgnoringCase(Trimmed(text), word.name)) return word.value;
  }
  return std::nullopt;
}

std::optional<uint32_t> ParseBits(std::string_view text, std::span<const Word> words) {
  uint32_t bits = 0;
  for (size_t begin = 0; begin <= text.size();) {
    const size_t end = std::min(text.find('|', begin), text.size());
    const std::optional<uint32_t> bit = ParseWord(text.substr(begin, end - begin), words);
    if (!bit) return std::nullopt;
    bits |= *bit;
    begin = end + 1;
  }
  return bits;
}

std::optional<uint32_t> ParseOldFiles(std::string_view text) {
  const std::optional<uint64_t> number = ParseSize(text);
  if (!number || *number > kMostOldFiles) return std::nullopt;
  return static_cast<uint32_t>(*number);
}

// One child element of the configuration: its name, and how its text changes the settings. False: not understood.
struct Element {
  std::string_view name;
  bool (*apply)(std::string_view text, Settings& settings);
};

template <class Value, class Parsed>
bool Take(const std::optional<Parsed>& parsed, Value& value) {
  if (parsed) value = static_cast<Value>(*parsed);
  return parsed.has_value();
}

constexpr Element kElements[] = {
    {"enabled", [](std::string_view text, Settings& s) { return Take(ParseWord(text, kSwitch), s.enabled); }},
    {"level", [](std::string_view text, Settings& s) { return Take(ParseLevels(text), s.levels); }},
    {"depth", [](std::string_view text, Settings& s) { return Take(ParseWord(text, kDepths), s.depth); }},
    {"type", [](std::string_view text, Settings& s) { return Take(ParseBits(text, kTypes), s.types); }},
    {"mode", [](std::string_view text, Settings& s) { return Take(ParseWord(text, kModes), s.mode); }},
    {"maxSize", [](std::string_view text, Settings& s) { return Take(ParseSize(text), s.maxBytes); }},
    {"oldFiles", [](std::string_view text, Settings& s) { return Take(ParseOldFiles(text), s.oldFiles); }},
    {"path", [](std::string_view, Settings&) { return true; }},  // see ConfiguredLogFolder
};

void ApplyElement(const tinyxml2::XMLElement& child, ParsedSettings& parsed) {
  const std::string text = child.GetText() == nullptr ? "" : child.GetText();
  for (const Element& element : kElements) {
    if (element.name != child.Name()) continue;
    if (!element.apply(text, *parsed.settings)) {
      parsed.problems.push_back("\"" + text + "\" is not a value of \"" + child.Name() + "\", its default is used");
    }
    return;
  }
  parsed.problems.push_back(std::string("there is no setting \"") + child.Name() + "\"");
}

}  // namespace

std::optional<uint32_t> ParseLevels(std::string_view text) {
  return ParseBits(text, kLevels);
}

std::optional<uint64_t> ParseSize(std::string_view text) {
  text = Trimmed(text);
  uint64_t number = 0;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  if (error != std::errc()) return std::nullopt;
  const std::optional<uint32_t> shift = ParseWord(text.substr(static_cast<size_t>(end - text.data())), kUnits);
  if (!shift || number > std::numeric_limits<uint64_t>::max() >> *shift) return std::nullopt;
  return number << *shift;
}

ParsedSettings ParseSettings(std::string_view xml) {
  ParsedSettings parsed;
  tinyxml2::XMLDocument document;
  document.Parse(xml.data(), xml.size());
  const tinyxml2::XMLElement* configuration = document.FirstChildElement("configuration");
  if (document.Error()) {
    parsed.problems.push_back(std::string("not XML: ") + document.ErrorStr());
  } else if (configuration == nullptr) {
    parsed.problems.push_back("the element \"configuration\" is missing");
  } else {
    parsed.settings.emplace();
    parsed.settings->folder = logging::ConfiguredLogFolder(*configuration);
    for (const auto* child = configuration->FirstChildElement(); child != nullptr;
         child = child->NextSiblingElement()) {
      ApplyElement(*child, parsed);
    }
  }
  return parsed;
}

}  // namespace logfile
