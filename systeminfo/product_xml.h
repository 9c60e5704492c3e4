// What the product's XML files say: where its crash handler writes dumps, and when it last looked for and applied
// updates. Bytes in (UTF-8), plain values out; the functions that read the files are in product_settings.h.
#pragma once

#include <json/value.h>

#include <string>
#include <string_view>
#include <vector>

namespace systeminfo {

enum class XmlOutcome {
  kFound,
  kNotXml,   // also XML that nests deeper than 500 elements
  kMissing,  // XML, but not with the element that matters
};

struct DumpPathText {
  XmlOutcome outcome = XmlOutcome::kMissing;
  std::string text;  // of settings/qxreinit/DumpPath without blanks around it; not empty when found
};
DumpPathText ParseDumpPath(std::string_view xml);

struct UpdateStatistics {
  XmlOutcome outcome = XmlOutcome::kMissing;  // of the root element "UpdateStatistics"
  // {name: {"check": {"time": ...}, "update": {"time": ...}}} for each child element of the root; a time is the
  // attribute's text or null. Of two elements with one name the later counts.
  Json::Value elements{Json::objectValue};
  std::vector<std::string> invalidElements;  // names of the children without "Check" or "Update"; they are left out
  std::vector<std::string> missingTimes;     // "element/Check" of each "Check" or "Update" without the attribute
};
UpdateStatistics ParseUpdateStatistics(std::string_view xml);

}  // namespace systeminfo
