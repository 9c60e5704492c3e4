// An opened collection as the rules see it: the collectors' documents, the names of all files of the package, and what
// was wrong with the package itself. Nothing in it can be trusted.
#pragma once

#include <json/value.h>

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "report/finding.h"

namespace report {

struct PackageFile {
  std::string name;  // components divided by "/"
  uint64_t size = 0;
};

struct Collection {
  std::map<std::string, Json::Value, std::less<>> documents;  // by the name of the collector, without ".json"
  std::vector<PackageFile> files;                             // of the whole package
  std::vector<Evidence> unreadable;                           // documents that are there, but are no JSON
  std::vector<Evidence> leftOut;                              // entries that are not safe to use
  // When the collection began, in seconds since 1970-01-01 UTC by the customer's clock. Rules never ask another clock.
  std::optional<double> collectedAt;
  // How far the customer's local time was ahead of UTC then, in seconds.
  std::optional<double> utcOffset;

  // The null value when there is none.
  const Json::Value& Document(std::string_view name) const;
};

inline constexpr char kManifestName[] = "collection_manifest";

// A file that only a collection has: by one of them a folder is known as that of the collectors' files.
bool IsDocumentName(std::string_view name);

// Parses `text` into the document `name`, or notes why it cannot be.
void AddDocument(Collection& collection, std::string_view name, std::string_view text);

// Takes the time and the zone from the documents, once all are there.
void SetCollectionTime(Collection& collection);

}  // namespace report
