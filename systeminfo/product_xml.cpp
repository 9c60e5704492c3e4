#include "systeminfo/product_xml.h"

#include <tinyxml2.h>

#include "core/text.h"

namespace systeminfo {
namespace {

// {"time": ...} of the child `name` of `element`; null when there is no such child.
Json::Value ReadTime(const tinyxml2::XMLElement& element, const char* name, UpdateStatistics& statistics) {
  const tinyxml2::XMLElement* child = element.FirstChildElement(name);
  if (child == nullptr) return {};
  Json::Value result(Json::objectValue);
  const char* time = child->Attribute("time");
  result["time"] = time == nullptr ? Json::Value() : Json::Value(time);
  if (time == nullptr) statistics.missingTimes.push_back(std::string(element.Name()) + "/" + name);
  return result;
}

}  // namespace

DumpPathText ParseDumpPath(std::string_view xml) {
  tinyxml2::XMLDocument document;
  if (document.Parse(xml.data(), xml.size()) != tinyxml2::XML_SUCCESS) return {XmlOutcome::kNotXml, {}};
  const tinyxml2::XMLElement* element = document.FirstChildElement("settings");
  for (const char* name : {"qxreinit", "DumpPath"}) {
    if (element != nullptr) element = element->FirstChildElement(name);
  }
  const std::string_view text = Trimmed(element == nullptr ? nullptr : element->GetText());
  return {text.empty() ? XmlOutcome::kMissing : XmlOutcome::kFound, std::string(text)};
}

UpdateStatistics ParseUpdateStatistics(std::string_view xml) {
  UpdateStatistics statistics;
  tinyxml2::XMLDocument document;
  if (document.Parse(xml.data(), xml.size()) != tinyxml2::XML_SUCCESS) {
    statistics.outcome = XmlOutcome::kNotXml;
    return statistics;
  }
  const tinyxml2::XMLElement* root = document.FirstChildElement("UpdateStatistics");
  if (root == nullptr) return statistics;
  statistics.outcome = XmlOutcome::kFound;
  for (const auto* element = root->FirstChildElement(); element != nullptr; element = element->NextSiblingElement()) {
    Json::Value check = ReadTime(*element, "Check", statistics);
    Json::Value update = check.isNull() ? Json::Value() : ReadTime(*element, "Update", statistics);
    if (update.isNull()) {
      statistics.invalidElements.emplace_back(element->Name());
      continue;
    }
    Json::Value& entry = statistics.elements[element->Name()];
    entry = Json::Value(Json::objectValue);
    entry["check"].swap(check);
    entry["update"].swap(update);
  }
  return statistics;
}

}  // namespace systeminfo
