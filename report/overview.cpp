#include "report/overview.h"

#include <algorithm>
#include <cstdint>

#include "report/facts.h"
#include "report/rule_functions.h"
#include "report/tables/table.h"
#include "report/times.h"

namespace report {
namespace {

constexpr size_t kMostMissing = 1'000;
constexpr double kGiB = 1024.0 * 1024 * 1024;

const Json::Value& Issue(const Collection& collection) {
  return Member(collection.Document("guiData"), "issue");
}

// Texts and numbers alike; empty for what is neither.
std::string AnyText(const Json::Value& value) {
  return value.isNull() ? std::string() : TextOf(TextCell(value));
}

std::string Joined(const std::vector<std::string>& parts, const char* between) {
  std::string joined;
  for (const std::string& part : parts) {
    if (!part.empty()) joined += (joined.empty() ? "" : between) + part;
  }
  return joined;
}

std::optional<double> LocalTime(const Collection& collection, const Json::Value& utcSeconds) {
  const auto seconds = NumberOf(utcSeconds);
  if (!seconds || *seconds <= 0 || !collection.utcOffset) return std::nullopt;
  const Cell time = TimeCell(*seconds + *collection.utcOffset);
  return time.isNull() ? std::nullopt : std::optional(*seconds + *collection.utcOffset);
}

std::string WithTenth(double value) {
  const auto tenths = static_cast<int64_t>(std::clamp(value * 10 + 0.5, 0.0, 1e15));
  return std::to_string(tenths / 10) + "." + std::to_string(tenths % 10);
}

void AddCollectorsWithout(const Collection& collection, std::vector<LabelledText>& missing) {
  ForEachElement(Member(collection.Document(kManifestName), "collectors"),
                 [&](const Json::Value& collector, const std::string&) {
                   const std::string outcome = TextOf(Member(collector, "outcome"));
                   if (outcome.empty() || outcome == "data") return;
                   missing.push_back({TextOf(Member(collector, "name")) + ".json",
                                      Joined({outcome, TextOf(Member(collector, "reason"))}, ": ")});
                 });
}

void AddEvidence(const std::vector<Evidence>& found, std::vector<LabelledText>& missing) {
  for (const Evidence& evidence : found)
    missing.push_back({evidence.file, evidence.text});
}

}  // namespace

std::vector<LabelledText> UserWords(const Collection& collection) {
  const Json::Value& user = Member(collection.Document("guiData"), "user_details");
  const Json::Value& issue = Issue(collection);
  const Json::Value& reproducible = Member(issue, "can_be_reproduced");
  std::vector<LabelledText> words = {{"Name", AnyText(Member(user, "name"))},
                                     {"E-mail", AnyText(Member(user, "email"))},
                                     {"Issue", AnyText(Member(issue, "name"))},
                                     {"Description", AnyText(Member(issue, "description"))},
                                     {"Can be reproduced", ""}};
  if (reproducible.isBool()) words.back().text = reproducible.asBool() ? "yes" : "no";
  std::erase_if(words, [](const LabelledText& word) { return word.text.empty(); });
  return words;
}

std::string MachineLine(const Collection& collection) {
  const Json::Value& summary = collection.Document("system_summary");
  const auto text = [&](const char* name) { return AnyText(Member(summary, name)); };
  const std::string version = text("OS Version");
  const std::string name = Joined({text("OS Name"), text("OS CSD Version")}, " ");
  const auto memory = NumberOf(Member(summary, "Installed Physical Memory"));
  const std::string line =
      Joined({text("System Name"), Joined({text("System Manufacturer"), text("System Model")}, " "),
              name + (version.empty() ? "" : " (" + version + ")"), text("System Type"), text("CPU Name"),
              memory ? WithTenth(*memory / kGiB) + " GiB of memory" : ""},
             ", ");
  return Shortened(line, kLongestCell);
}

std::string ProductLine(const Collection& collection) {
  std::string line;
  ForEachElement(collection.Document("installed_software"), [&](const Json::Value& entry, const std::string&) {
    if (!line.empty() || TextOf(Member(entry, "Publisher")) != kPublisher) return;
    line = Joined({AnyText(Member(entry, "Name")), AnyText(Member(entry, "Version"))}, " ");
  });
  const std::string location = InstallLocation(collection);
  EvidenceList missing;
  FindMissingProduct(collection, missing);
  if (!location.empty()) line = Joined({line, "in " + location}, " ");
  if (line.empty() && missing.Count() > 0) line = "The product is not installed.";
  return Shortened(line, kLongestCell);
}

std::vector<LabelledText> MissingParts(const Collection& collection) {
  std::vector<LabelledText> missing;
  EvidenceList found;
  FindMissingManifest(collection, found);
  FindMissingDocuments(collection, found);
  AddEvidence(found.Kept(), missing);
  AddCollectorsWithout(collection, missing);
  AddEvidence(collection.unreadable, missing);
  AddEvidence(collection.leftOut, missing);
  if (missing.size() > kMostMissing) missing.resize(kMostMissing);
  for (LabelledText& part : missing)
    part = {Shortened(part.label, kLongestRowPath), Shortened(part.text, kLongestCell)};
  return missing;
}

std::vector<Gauge> Gauges(const Collection& collection) {
  constexpr size_t kMost = 100;
  std::vector<Gauge> gauges;
  const auto add = [&](const std::string& name, const Json::Value& total, const Json::Value& free, bool isMemory) {
    const auto all = NumberOf(total);
    const auto rest = NumberOf(free);
    if (!all || !rest || *all <= 0 || *rest < 0 || gauges.size() >= kMost) return;
    gauges.push_back({Shortened(name, kLongestRowPath), std::max(0.0, *all - *rest), *all, isMemory});
  };
  ForEachElement(
      Member(collection.Document("storage"), "Partitions"), [&](const Json::Value& drive, const std::string&) {
        add(AnyText(Member(drive, "Drive Letter")), Member(drive, "Size"), Member(drive, "Free Space"), false);
      });
  const Json::Value& summary = collection.Document("system_summary");
  add("Memory", Member(summary, "Installed Physical Memory"), Member(summary, "Available Physical Memory"), true);
  return gauges;
}

Interval ReproductionInterval(const Collection& collection) {
  const Json::Value& issue = Issue(collection);
  return {LocalTime(collection, Member(issue, "reproduce_start_time")),
          LocalTime(collection, Member(issue, "reproduce_stop_time"))};
}

}  // namespace report
