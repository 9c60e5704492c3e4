#include <algorithm>
#include <cmath>
#include <cstdint>
#include <iterator>
#include <set>
#include <span>
#include <string>
#include <vector>

#include "report/facts.h"
#include "report/rule_functions.h"
#include "report/times.h"
#include "report/windows_text.h"

namespace report {
namespace {

constexpr char kEventsFile[] = "windows_events.json";
constexpr char kErrorType[] = "1";  // EVENTLOG_ERROR_TYPE; the old interface shows critical events as errors too

constexpr double kBurstTime = kHour;
constexpr size_t kBurstErrors = 20;
constexpr double kClockJump = kHour;  // the largest step that summer time makes

constexpr std::string_view kCrashSources[] = {"Application Error", "Application Hang", ".NET Runtime",
                                              "Windows Error Reporting"};
constexpr std::string_view kStorageSources[] = {"atapi", "disk",     "iaStorA",  "Microsoft-Windows-Ntfs",
                                                "Ntfs",  "stornvme", "storahci", "volmgr"};
constexpr std::string_view kSystemCrashSources[] = {"BugCheck", "Microsoft-Windows-Kernel-Power",
                                                    "Microsoft-Windows-WER-SystemErrorReporting"};

bool IsOneOf(std::span<const std::string_view> names, std::string_view name) {
  return std::find(names.begin(), names.end(), name) != names.end();
}

// `visit` (event, "log[index]"), newest first, as they stand.
template <class Visit>
void ForEachEvent(const Collection& collection, const char* log, Visit visit) {
  ForEachElement(Member(collection.Document("windows_events"), log),
                 [&](const Json::Value& event, const std::string& i) { visit(event, log + i); });
}

bool IsErrorOf(const Json::Value& event, std::span<const std::string_view> sources) {
  return TextOf(Member(event, "EventType")) == kErrorType && IsOneOf(sources, TextOf(Member(event, "SourceName")));
}

// The message and the inserted texts, of which the message says nothing.
std::string TextsOf(const Json::Value& event) {
  constexpr size_t kMost = 300;  // bytes of what is shown
  std::string texts = TextOf(Member(event, "message"));
  ForEachElement(Member(event, "InsertionStrings"), [&](const Json::Value& text, const std::string&) {
    if (!TextOf(text).empty()) texts += (texts.empty() ? "" : " | ") + TextOf(text);
  });
  return Shortened(texts, kMost);
}

std::string Describe(const Json::Value& event) {
  return TextOf(Member(event, "TimeGenerated")) + " " + TextOf(Member(event, "SourceName")) + ": " + TextsOf(event);
}

// One of the inserted texts is one of the names, or a path that ends in one; both in lower case.
bool NamesOneOf(const Json::Value& event, const std::set<std::string>& names) {
  bool isNamed = false;
  ForEachElement(Member(event, "InsertionStrings"), [&](const Json::Value& text, const std::string&) {
    const std::string lower = LowerAscii(TextOf(text));
    isNamed = isNamed || names.contains(lower) || names.contains(std::string(FileNameOf(lower)));
  });
  return isNamed;
}

std::set<std::string> ProductFileNames(const Collection& collection) {
  std::set<std::string> names;
  ForEachProductFile(collection, [&](const Json::Value& file, const std::string&) {
    const std::string path = TextOf(Member(file, "path"));
    if (!path.empty()) names.insert(LowerAscii(FileNameOf(path)));
  });
  return names;
}

// Display names too: that is what the service manager's events show.
std::set<std::string> ProductServiceNames(const Collection& collection) {
  std::set<std::string> names;
  ForEachElement(collection.Document("services"), [&](const Json::Value& service, const std::string&) {
    if (!IsProductFile(collection, ProgramOf(TextOf(Member(service, "PathName"))))) return;
    for (const char* member : {"Name", "DisplayName"}) {
      const std::string name = LowerAscii(TextOf(Member(service, member)));
      if (!name.empty()) names.insert(name);
    }
  });
  return names;
}

// What the last hour of the log holds, seen from its newest record, which is in the log's own time.
void FindErrorBurst(const Collection& collection, const char* log, EvidenceList& found) {
  std::optional<double> newest;
  std::vector<std::string> errors;
  ForEachEvent(collection, log, [&](const Json::Value& event, const std::string&) {
    const auto time = TimeFromEvent(TextOf(Member(event, "TimeGenerated")));
    if (!time) return;
    if (!newest) newest = time;
    const bool isLate = *newest - *time <= kBurstTime;
    if (isLate && TextOf(Member(event, "EventType")) == kErrorType) errors.push_back(Describe(event));
  });
  if (errors.size() < kBurstErrors) return;
  if (collection.collectedAt && *collection.collectedAt - *newest > kDay + kLocalTimeSlack) return;
  found.Add(kEventsFile, log, std::to_string(errors.size()) + " errors in one hour, the last: " + errors.front());
}

void FindClockJump(const Collection& collection, const char* log, EvidenceList& found) {
  std::optional<double> newer;
  ForEachEvent(collection, log, [&](const Json::Value& event, const std::string& path) {
    const std::string text = TextOf(Member(event, "TimeGenerated"));
    const auto time = TimeFromEvent(text);
    if (!time) return;
    const bool isAhead = collection.collectedAt && *time - *collection.collectedAt > kLocalTimeSlack;
    if (isAhead) {
      found.Add(kEventsFile, path + ".TimeGenerated", text + " is after the collection");
    } else if (newer && *time - *newer > kClockJump) {
      found.Add(kEventsFile, path + ".TimeGenerated", text + " is later than the record that follows it");
    }
    newer = time;
  });
}

}  // namespace

void FindProductCrashes(const Collection& collection, EvidenceList& found) {
  const std::set<std::string> names = ProductFileNames(collection);
  ForEachEvent(collection, "Application", [&](const Json::Value& event, const std::string& path) {
    if (!IsOneOf(kCrashSources, TextOf(Member(event, "SourceName"))) || !NamesOneOf(event, names)) return;
    found.Add(kEventsFile, path, Describe(event));
  });
}

void FindServiceFailures(const Collection& collection, EvidenceList& found) {
  constexpr std::string_view kSources[] = {"Service Control Manager"};
  const std::set<std::string> names = ProductServiceNames(collection);
  ForEachEvent(collection, "System", [&](const Json::Value& event, const std::string& path) {
    if (IsErrorOf(event, kSources) && NamesOneOf(event, names)) found.Add(kEventsFile, path, Describe(event));
  });
}

void FindErrorBursts(const Collection& collection, EvidenceList& found) {
  for (const char* log : {"Application", "System"})
    FindErrorBurst(collection, log, found);
}

void FindStorageErrors(const Collection& collection, EvidenceList& found) {
  ForEachEvent(collection, "System", [&](const Json::Value& event, const std::string& path) {
    if (IsErrorOf(event, kStorageSources)) found.Add(kEventsFile, path, Describe(event));
  });
}

void FindSystemCrashes(const Collection& collection, EvidenceList& found) {
  ForEachEvent(collection, "System", [&](const Json::Value& event, const std::string& path) {
    if (IsErrorOf(event, kSystemCrashSources)) found.Add(kEventsFile, path, Describe(event));
  });
}

void FindClockJumps(const Collection& collection, EvidenceList& found) {
  for (const char* log : {"Application", "System"})
    FindClockJump(collection, log, found);
}

}  // namespace report
