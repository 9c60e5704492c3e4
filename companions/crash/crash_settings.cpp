#include "companions/crash/crash_settings.h"

#include <tinyxml2.h>

#include <charconv>
#include <optional>

#include "core/text.h"

namespace crash {
namespace {

std::optional<uint32_t> ParseCount(std::string_view text) {
  uint32_t count = 0;
  const char* const textEnd = text.data() + text.size();
  const auto [end, error] = std::from_chars(text.data(), textEnd, count);
  if (error != std::errc() || end != textEnd || count < 1 || count > kMostDumps) return std::nullopt;
  return count;
}

void ReadElements(const tinyxml2::XMLElement& parent, ParsedSettings& parsed) {
  if (const tinyxml2::XMLElement* path = parent.FirstChildElement("DumpPath")) {
    const std::string_view text = Trimmed(path->GetText());
    if (text.empty()) {
      parsed.problems.emplace_back("\"DumpPath\" is empty, its default is used");
    } else {
      parsed.settings.dumpPath = text;
    }
  }
  if (const tinyxml2::XMLElement* count = parent.FirstChildElement("DumpCount")) {
    const std::string_view text = Trimmed(count->GetText());
    if (const std::optional<uint32_t> number = ParseCount(text)) {
      parsed.settings.dumpCount = *number;
    } else {
      parsed.problems.push_back("\"" + std::string(text) + "\" is not a value of \"DumpCount\", its default is used");
    }
  }
}

}  // namespace

ParsedSettings ParseSettings(std::string_view xml) {
  ParsedSettings parsed;
  tinyxml2::XMLDocument document;
  if (document.Parse(xml.data(), xml.size()) != tinyxml2::XML_SUCCESS) {
    parsed.problems.push_back(std::string("not XML: ") + document.ErrorStr());
    return parsed;
  }
  const tinyxml2::XMLElement* root = document.FirstChildElement("settings");
  const tinyxml2::XMLElement* parent = root == nullptr ? nullptr : root->FirstChildElement("qxreinit");
  if (parent == nullptr) {
    parsed.problems.emplace_back("the element settings/qxreinit is missing, defaults are used");
  } else {
    ReadElements(*parent, parsed);
  }
  return parsed;
}

}  // namespace crash
