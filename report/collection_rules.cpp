#include <set>
#include <string>

#include "report/json_access.h"
#include "report/rule_functions.h"
#include "report/windows_text.h"

namespace report {
namespace {

constexpr char kManifestFile[] = "collection_manifest.json";

template <class Visit>
void ForEachCollector(const Collection& collection, Visit visit) {
  ForEachElement(Member(collection.Document(kManifestName), "collectors"),
                 [&](const Json::Value& collector, const std::string& path) { visit(collector, "collectors" + path); });
}

void AddWithOutcome(const Collection& collection, std::string_view outcome, EvidenceList& found) {
  ForEachCollector(collection, [&](const Json::Value& collector, const std::string& path) {
    if (TextOf(Member(collector, "outcome")) != outcome) return;
    const std::string reason = TextOf(Member(collector, "reason"));
    found.Add(kManifestFile, path, TextOf(Member(collector, "name")) + (reason.empty() ? "" : ": " + reason));
  });
}

}  // namespace

void FindMissingManifest(const Collection& collection, EvidenceList& found) {
  if (!collection.Document(kManifestName).isObject()) found.Add(kManifestFile, "", "is missing or cannot be used");
}

void FindFailedCollectors(const Collection& collection, EvidenceList& found) {
  AddWithOutcome(collection, "failed", found);
  AddWithOutcome(collection, "timed out", found);
}

void FindUnwrittenCollectors(const Collection& collection, EvidenceList& found) {
  AddWithOutcome(collection, "not written", found);
}

void FindCollectorErrors(const Collection& collection, EvidenceList& found) {
  ForEachCollector(collection, [&](const Json::Value& collector, const std::string& path) {
    const Json::Value& errors = Member(collector, "errors");
    if (!errors.isArray() || errors.empty()) return;
    const std::string count = errors.size() == 1 ? "1 error" : std::to_string(errors.size()) + " errors, the first";
    found.Add(kManifestFile, path + ".errors",
              TextOf(Member(collector, "name")) + ": " + count + ": " + TextOf(errors[0]));
  });
}

void FindMissingDocuments(const Collection& collection, EvidenceList& found) {
  std::set<std::string> names;
  for (const PackageFile& file : collection.files)
    names.insert(std::string(FileNameOf(file.name)));
  ForEachCollector(collection, [&](const Json::Value& collector, const std::string& path) {
    const std::string name = TextOf(Member(collector, "name"));
    // Dumps are a collector's only result that is no document.
    if (name.empty() || name == "process_dumps" || TextOf(Member(collector, "outcome")) != "data") return;
    if (!names.contains(name + ".json")) found.Add(name + ".json", "", "was collected, see " + path);
  });
}

void FindUnreadableDocuments(const Collection& collection, EvidenceList& found) {
  for (const Evidence& document : collection.unreadable)
    found.Add(document.file, document.path, document.text);
}

void FindLeftOutEntries(const Collection& collection, EvidenceList& found) {
  for (const Evidence& entry : collection.leftOut)
    found.Add(entry.file, entry.path, entry.text);
}

}  // namespace report
