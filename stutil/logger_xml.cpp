#include "stutil/logger_xml.h"

#include <tinyxml2.h>

#include "core/log_folder.h"

namespace stutil {
namespace {

constexpr char kConfiguration[] = "configuration";
constexpr char kDepth[] = "depth";
constexpr char kLevel[] = "level";

tinyxml2::XMLElement* Parse(std::string_view text, tinyxml2::XMLDocument& document) {
  if (document.Parse(text.data(), text.size()) != tinyxml2::XML_SUCCESS) return nullptr;
  return document.FirstChildElement(kConfiguration);
}

std::optional<std::string> TextOf(const tinyxml2::XMLElement& configuration, const char* name) {
  const tinyxml2::XMLElement* const element = configuration.FirstChildElement(name);
  if (element == nullptr) return std::nullopt;
  const char* const text = element->GetText();
  return text == nullptr ? std::string() : std::string(text);
}

void SetText(tinyxml2::XMLElement& configuration, const char* name, const std::optional<std::string>& text) {
  tinyxml2::XMLElement* element = configuration.FirstChildElement(name);
  if (!text) {
    if (element != nullptr) configuration.DeleteChild(element);
    return;
  }
  if (element == nullptr) element = configuration.InsertNewChildElement(name);
  element->SetText(text->c_str());
}

}  // namespace

std::optional<LoggerXml> ReadLoggerXml(std::string_view text) {
  tinyxml2::XMLDocument document;
  const tinyxml2::XMLElement* const configuration = Parse(text, document);
  if (configuration == nullptr) return std::nullopt;
  return LoggerXml{{TextOf(*configuration, kDepth), TextOf(*configuration, kLevel)},
                   logging::ConfiguredLogFolder(*configuration)};
}

std::optional<std::string> WithLoggerLevels(std::string_view text, const LoggerLevels& levels) {
  // Blanks between elements are kept, so that the file still looks as its owner laid it out.
  tinyxml2::XMLDocument document(true, tinyxml2::PEDANTIC_WHITESPACE);
  tinyxml2::XMLElement* const configuration = Parse(text, document);
  if (configuration == nullptr) return std::nullopt;
  SetText(*configuration, kDepth, levels.depth);
  SetText(*configuration, kLevel, levels.level);
  tinyxml2::XMLPrinter printer(nullptr, true);  // compact: the blanks are in the document already
  document.Print(&printer);
  return std::string(printer.CStr());
}

}  // namespace stutil
