#include <algorithm>
#include <cmath>
#include <cstdint>
#include <optional>
#include <string>

#include "report/facts.h"
#include "report/rule_functions.h"
#include "report/times.h"

namespace report {
namespace {

constexpr char kProductFile[] = "product_information.json";
constexpr double kOldestUpdate = 7 * kDay;

struct Update {
  std::string path;
  std::string name;
  std::optional<double> checked;  // seconds since 1970-01-01 UTC
  std::optional<double> updated;
};

template <class Visit>
void ForEachUpdate(const Collection& collection, Visit visit) {
  ForEachMember(Member(collection.Document("product_information"), "last_update"),
                [&](const std::string& name, const Json::Value& update) {
                  visit(Update{"last_update." + name, name, NumberOf(Member(Member(update, "check"), "time")),
                               NumberOf(Member(Member(update, "update"), "time"))});
                });
}

std::string Days(double seconds) {
  constexpr double kMost = 100'000;  // also what a senseless number is shown as
  return std::to_string(static_cast<int64_t>(std::min(std::floor(seconds / kDay), kMost))) + " days";
}

struct Moment {
  std::optional<double> Update::*time;
  const char* path;  // below the update's
  const char* verb;
};

void FindOldMoments(const Collection& collection, const Moment& moment, EvidenceList& found) {
  if (!collection.collectedAt) return;
  ForEachUpdate(collection, [&](const Update& update) {
    const std::optional<double> time = update.*moment.time;
    if (!time || *collection.collectedAt - *time <= kOldestUpdate) return;
    found.Add(kProductFile, update.path + moment.path,
              update.name + moment.verb + Days(*collection.collectedAt - *time) + " before the collection");
  });
}

}  // namespace

void FindOldUpdates(const Collection& collection, EvidenceList& found) {
  FindOldMoments(collection, {&Update::updated, ".update.time", " was updated "}, found);
}

void FindOldUpdateChecks(const Collection& collection, EvidenceList& found) {
  FindOldMoments(collection, {&Update::checked, ".check.time", " was looked for "}, found);
}

void FindChecksOlderThanUpdates(const Collection& collection, EvidenceList& found) {
  ForEachUpdate(collection, [&](const Update& update) {
    if (!update.checked || !update.updated || *update.updated - *update.checked <= kHour) return;
    found.Add(kProductFile, update.path, update.name + ": the last check is older than the last update");
  });
}

void FindUpdatesInTheFuture(const Collection& collection, EvidenceList& found) {
  if (!collection.collectedAt) return;
  ForEachUpdate(collection, [&](const Update& update) {
    const bool isAhead = update.updated && *update.updated - *collection.collectedAt > kHour;
    if (isAhead)
      found.Add(kProductFile, update.path + ".update.time", update.name + " was updated after the collection");
  });
}

void FindMissingUpdates(const Collection& collection, EvidenceList& found) {
  if (InstallLocation(collection).empty()) return;
  bool hasUpdate = false;
  ForEachUpdate(collection, [&](const Update& update) { hasUpdate = hasUpdate || update.updated; });
  if (!hasUpdate) found.Add(kProductFile, "last_update", "no update has a time");
}

}  // namespace report
