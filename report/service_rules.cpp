#include <algorithm>
#include <iterator>
#include <string>

#include "report/facts.h"
#include "report/rule_functions.h"
#include "report/windows_text.h"

namespace report {
namespace {

constexpr char kServicesFile[] = "services.json";
constexpr char kTasksFile[] = "running_tasks.json";
constexpr size_t kManyHandles = 10'000;

// Programs of the system that others like to be taken for, each of which lies in the folder of Windows.
constexpr std::string_view kSystemPrograms[] = {"csrss.exe", "explorer.exe", "lsass.exe",   "services.exe",
                                                "smss.exe",  "svchost.exe",  "wininit.exe", "winlogon.exe"};

template <class Visit>
void ForEachProductService(const Collection& collection, Visit visit) {
  ForEachElement(collection.Document("services"), [&](const Json::Value& service, const std::string& path) {
    if (IsProductFile(collection, ProgramOf(TextOf(Member(service, "PathName"))))) visit(service, path);
  });
}

}  // namespace

void FindStoppedServices(const Collection& collection, EvidenceList& found) {
  ForEachProductService(collection, [&](const Json::Value& service, const std::string& path) {
    const std::string state = TextOf(Member(service, "State"));
    if (TextOf(Member(service, "StartMode")) != "Auto" || state.empty() || state == "Running") return;
    found.Add(kServicesFile, path + ".State", TextOf(Member(service, "Name")) + " is " + state);
  });
}

void FindDisabledServices(const Collection& collection, EvidenceList& found) {
  ForEachProductService(collection, [&](const Json::Value& service, const std::string& path) {
    if (TextOf(Member(service, "StartMode")) != "Disabled") return;
    found.Add(kServicesFile, path + ".StartMode", TextOf(Member(service, "Name")) + " is disabled");
  });
}

void FindStoppedDrivers(const Collection& collection, EvidenceList& found) {
  ForEachElement(collection.Document("system_drivers"), [&](const Json::Value& driver, const std::string& path) {
    const std::string mode = TextOf(Member(driver, "StartMode"));
    const std::string state = TextOf(Member(driver, "State"));
    const bool isOurs = IsProductFile(collection, ProgramOf(TextOf(Member(driver, "PathName")))) ||
                        ContainsNoCase(TextOf(Member(driver, "Description")), kPublisher);
    const bool startsByItself = mode == "Boot" || mode == "System" || mode == "Auto";
    if (!isOurs || !startsByItself || state.empty() || state == "Running") return;
    found.Add("system_drivers.json", path + ".State", TextOf(Member(driver, "Name")) + " is " + state);
  });
}

void FindProcessesInTemporaryFolders(const Collection& collection, EvidenceList& found) {
  ForEachProcess(collection, [&](const Json::Value& process, const std::string& path) {
    const std::string executable = TextOf(Member(process, "ExecutablePath"));
    if (LiesInTemporaryFolder(executable)) found.Add(kTasksFile, path + ".ExecutablePath", executable);
  });
}

void FindManyHandles(const Collection& collection, EvidenceList& found) {
  ForEachProcess(collection, [&](const Json::Value& process, const std::string& path) {
    const Json::Value& handles = Member(process, "handles");
    if (!handles.isArray() || handles.size() < kManyHandles) return;
    found.Add(kTasksFile, path + ".handles",
              TextOf(Member(process, "Name")) + " has " + std::to_string(handles.size()) + " handles");
  });
}

void FindMisplacedSystemPrograms(const Collection& collection, EvidenceList& found) {
  const std::string windows = TextOf(Member(collection.Document("system_summary"), "Windows Directory"));
  if (windows.empty()) return;
  ForEachProcess(collection, [&](const Json::Value& process, const std::string& path) {
    const std::string executable = TextOf(Member(process, "ExecutablePath"));
    const std::string name = LowerAscii(FileNameOf(executable));
    const bool isKnown =
        std::find(std::begin(kSystemPrograms), std::end(kSystemPrograms), name) != std::end(kSystemPrograms);
    if (isKnown && !LiesBelow(windows, executable)) found.Add(kTasksFile, path + ".ExecutablePath", executable);
  });
}

}  // namespace report
