#include "report/collection.h"

#include <algorithm>
#include <cmath>
#include <iterator>

#include "core/json.h"
#include "report/json_access.h"
#include "report/times.h"

namespace report {
namespace {

constexpr std::string_view kDocumentNames[] = {
    kManifestName, "installed_software",  "installed_updates", "network",       "printers",         "processor",
    "registry",    "product_information", "running_tasks",     "services",      "startup_programs", "storage",
    "guiData",     "system_drivers",      "system_summary",    "windows_events"};

}  // namespace

const Json::Value& Collection::Document(std::string_view name) const {
  const auto found = documents.find(name);
  return found == documents.end() ? Json::Value::nullSingleton() : found->second;
}

bool IsDocumentName(std::string_view name) {
  return std::find(std::begin(kDocumentNames), std::end(kDocumentNames), name) != std::end(kDocumentNames);
}

void AddDocument(Collection& collection, std::string_view name, std::string_view text) {
  Json::Value value;
  std::string error;
  if (ParseJson(text, value, error)) {
    collection.documents.insert_or_assign(std::string(name), std::move(value));
    return;
  }
  std::replace(error.begin(), error.end(), '\n', ' ');
  collection.unreadable.push_back({std::string(name) + ".json", "", "is no JSON document: " + error});
}

void SetCollectionTime(Collection& collection) {
  const Json::Value& manifest = collection.Document(kManifestName);
  collection.collectedAt = TimeFromIso(TextOf(Member(manifest, "start")));
  const auto minutes = NumberOf(Member(manifest, "utc_offset_minutes"));
  if (minutes && std::abs(*minutes) <= kLocalTimeSlack / 60) {
    collection.utcOffset = *minutes * 60;
  } else {
    collection.utcOffset = OffsetOfTimeZone(TextOf(Member(collection.Document("system_summary"), "Time Zone")));
  }
}

}  // namespace report
