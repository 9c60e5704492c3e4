#include <set>
#include <string>

#include "core/text.h"
#include "report/facts.h"
#include "report/rule_functions.h"
#include "report/windows_text.h"

namespace report {
namespace {

constexpr char kStartupFile[] = "startup_programs.json";

struct StartupValue {
  std::string path;   // in the document
  std::string key;    // in lower case
  std::string name;   // in lower case
  std::string value;  // without blanks around it

  bool KeyEndsIn(std::string_view end) const { return key.ends_with(end); }
};

// The registry values; the document's plain texts are files of startup folders.
template <class Visit>
void ForEachStartupValue(const Collection& collection, Visit visit) {
  ForEachElement(collection.Document("startup_programs"), [&](const Json::Value& entry, const std::string& path) {
    if (!Member(entry, "value").isString()) return;
    visit(StartupValue{path, LowerAscii(TextOf(Member(entry, "key"))), LowerAscii(TextOf(Member(entry, "name"))),
                       std::string(Trimmed(TextOf(Member(entry, "value"))))});
  });
}

bool IsRunKey(const StartupValue& entry) {
  const bool isRun = entry.KeyEndsIn("\\run") || entry.KeyEndsIn("\\runonce") || entry.KeyEndsIn("\\runonceex");
  return isRun && entry.key.find("\\startupapproved\\") == std::string::npos;
}

void AddEntry(EvidenceList& found, const StartupValue& entry) {
  found.Add(kStartupFile, entry.path + ".value", entry.key + "\\" + entry.name + " = " + entry.value);
}

// The paths of the product's programs and libraries, in lower case.
std::set<std::string> ProductFiles(const Collection& collection) {
  std::set<std::string> paths;
  ForEachProductFile(collection, [&](const Json::Value& file, const std::string&) {
    paths.insert(LowerAscii(TextOf(Member(file, "path"))));
  });
  return paths;
}

}  // namespace

void FindInjectedLibraries(const Collection& collection, EvidenceList& found) {
  ForEachStartupValue(collection, [&](const StartupValue& entry) {
    const bool isWindowsKey = entry.KeyEndsIn("\\windows nt\\currentversion\\windows");
    const bool isLoaded = entry.name == "appinit_dlls" || entry.name == "load" || entry.name == "run";
    const bool isInjection = (isWindowsKey && isLoaded) || entry.KeyEndsIn("\\appcertdlls") ||
                             (entry.KeyEndsIn("\\command processor") && entry.name == "autorun");
    if (isInjection && !entry.value.empty()) AddEntry(found, entry);
  });
}

void FindReplacedShell(const Collection& collection, EvidenceList& found) {
  ForEachStartupValue(collection, [&](const StartupValue& entry) {
    if (!entry.KeyEndsIn("\\winlogon") || entry.value.empty()) return;
    std::string program = LowerAscii(entry.value);
    while (program.ends_with(',') || program.ends_with(' '))
      program.pop_back();
    const bool isOther = (entry.name == "shell" && program != "explorer.exe") ||
                         (entry.name == "userinit" && FileNameOf(program) != "userinit.exe");
    if (isOther) AddEntry(found, entry);
  });
}

void FindStartupFromTemporaryFolders(const Collection& collection, EvidenceList& found) {
  ForEachStartupValue(collection, [&](const StartupValue& entry) {
    if (IsRunKey(entry) && LiesInTemporaryFolder(ProgramOf(entry.value))) AddEntry(found, entry);
  });
}

void FindStartupToNowhere(const Collection& collection, EvidenceList& found) {
  const std::set<std::string> files = ProductFiles(collection);
  ForEachStartupValue(collection, [&](const StartupValue& entry) {
    if (!IsRunKey(entry)) return;
    const std::string program = LowerAscii(ProgramOf(entry.value));
    // Of the product's folder alone the collection says which programs there are.
    const bool isProgram = program.ends_with(".exe") || program.ends_with(".dll");
    const bool isMissing = isProgram && IsProductFile(collection, program) && !files.contains(program);
    if (isMissing || (entry.value.empty() && !entry.name.empty())) AddEntry(found, entry);
  });
}

}  // namespace report
