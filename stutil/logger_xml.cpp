#include "stutil/logger_xml.h"

#include <tinyxml2.h>

#include <algorithm>

#include "core/log_folder.h"
#include "core/text.h"

namespace stutil {
namespace {

constexpr char kConfiguration[] = "configuration";
constexpr char kDepth[] = "depth";
constexpr char kLevel[] = "level";

// The reader is content with less than a document: it ends at a stray end tag or a zero byte, and takes text beside the
// root. Written again, such a file would lose its rest, or be one that nobody can read. Inside an element of our own
// the reader sees all three.
bool IsWholeDocument(std::string_view text) {
  constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
  if (text.starts_with(kByteOrderMark)) text.remove_prefix(kByteOrderMark.size());
  text = Trimmed(text);
  if (text.starts_with("<?")) text.remove_prefix(std::min(text.find("?>"), text.size() - 2) + 2);
  const std::string wrapped = "<document>" + std::string(text) + "</document>";
  tinyxml2::XMLDocument document;
  if (document.Parse(wrapped.data(), wrapped.size()) != tinyxml2::XML_SUCCESS) return false;
  const tinyxml2::XMLNode* node = document.RootElement()->FirstChild();
  while (node != nullptr && node->ToText() == nullptr)
    node = node->NextSibling();
  return node == nullptr;
}

tinyxml2::XMLElement* Parse(std::string_view text, tinyxml2::XMLDocument& document) {
  if (!IsWholeDocument(text) || document.Parse(text.data(), text.size()) != tinyxml2::XML_SUCCESS) return nullptr;
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
  tinyxml2::XMLDocument document(true, tinyxml2::PEDANTIC_WHITESPACE);  // an element that holds only blanks keeps them
  tinyxml2::XMLElement* const configuration = Parse(text, document);
  if (configuration == nullptr) return std::nullopt;
  SetText(*configuration, kDepth, levels.depth);
  SetText(*configuration, kLevel, levels.level);
  tinyxml2::XMLPrinter printer;
  document.Print(&printer);
  return std::string(printer.CStr());
}

}  // namespace stutil
