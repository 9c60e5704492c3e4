// The product's XML files.
#include "systeminfo/product_xml.h"

#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  using systeminfo::XmlOutcome;
  const auto path = systeminfo::ParseDumpPath(bytes);
  PROMISE((path.outcome == XmlOutcome::kFound) == !path.text.empty());

  const auto statistics = systeminfo::ParseUpdateStatistics(bytes);
  PROMISE(statistics.elements.isObject());
  PROMISE((path.outcome == XmlOutcome::kNotXml) == (statistics.outcome == XmlOutcome::kNotXml));
  PROMISE(statistics.outcome == XmlOutcome::kFound || statistics.elements.empty());
  for (const Json::Value& element : statistics.elements)
    PROMISE(element["check"].isObject() && element["update"].isObject());
}
