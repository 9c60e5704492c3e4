#include <algorithm>
#include <cstdint>
#include <string>

#include "report/facts.h"
#include "report/rule_functions.h"
#include "report/windows_text.h"

namespace report {
namespace {

constexpr double kMiB = 1024.0 * 1024.0;
constexpr double kGiB = 1024.0 * kMiB;
constexpr double kLowDiskShare = 0.10;
constexpr double kFullDrive = kGiB;
constexpr double kLowMemoryShare = 0.05;
constexpr double kSmallMemory = 2 * kGiB;

// For figures of any size: what a number's type could not hold is cut.
std::string MiB(double bytes) {
  return std::to_string(static_cast<int64_t>(std::clamp(bytes / kMiB, 0.0, 1e15))) + " MiB";
}

struct Drive {
  std::string path;
  std::string letter;
  bool isDisc = false;  // one that was written once is always full
  double size = 0;
  double free = 0;
};

// Drives of a known size only: not those without a medium.
template <class Visit>
void ForEachDrive(const Collection& collection, Visit visit) {
  ForEachElement(Member(collection.Document("storage"), "Partitions"),
                 [&](const Json::Value& partition, const std::string& path) {
                   const auto size = NumberOf(Member(partition, "Size"));
                   const auto free = NumberOf(Member(partition, "Free Space"));
                   if (!size || !free || *size <= 0 || *free < 0) return;
                   const std::string system = TextOf(Member(partition, "File System"));
                   visit(Drive{"Partitions" + path, TextOf(Member(partition, "Drive Letter")),
                               system == "CDFS" || system == "UDF", *size, *free});
                 });
}

void AddDrive(EvidenceList& found, const Drive& drive) {
  found.Add("storage.json", drive.path + ".Free Space",
            drive.letter + " has " + MiB(drive.free) + " free of " + MiB(drive.size));
}

}  // namespace

void FindLowDiskSpace(const Collection& collection, EvidenceList& found) {
  ForEachDrive(collection, [&](const Drive& drive) {
    if (drive.free < drive.size * kLowDiskShare && !drive.isDisc) AddDrive(found, drive);
  });
}

void FindFullSystemDrive(const Collection& collection, EvidenceList& found) {
  const std::string windows = TextOf(Member(collection.Document("system_summary"), "Windows Directory"));
  ForEachDrive(collection, [&](const Drive& drive) {
    if (LiesBelow(drive.letter, windows) && drive.free < kFullDrive) AddDrive(found, drive);
  });
}

void FindExhaustedMemory(const Collection& collection, EvidenceList& found) {
  const Json::Value& summary = collection.Document("system_summary");
  const auto installed = NumberOf(Member(summary, "Installed Physical Memory"));
  const auto available = NumberOf(Member(summary, "Available Physical Memory"));
  if (!installed || !available || *available >= *installed * kLowMemoryShare) return;
  found.Add("system_summary.json", "Available Physical Memory", MiB(*available) + " of " + MiB(*installed));
}

void FindSmallMemory(const Collection& collection, EvidenceList& found) {
  const auto installed = NumberOf(Member(collection.Document("system_summary"), "Installed Physical Memory"));
  if (!installed || *installed <= 0 || *installed >= kSmallMemory) return;
  found.Add("system_summary.json", "Installed Physical Memory", MiB(*installed));
}

}  // namespace report
