#include <map>
#include <string>
#include <vector>

#include "report/facts.h"
#include "report/rule_functions.h"
#include "report/windows_text.h"

namespace report {
namespace {

constexpr char kProductFile[] = "product_information.json";
constexpr char kTasksFile[] = "running_tasks.json";
constexpr char kSoftwareFile[] = "installed_software.json";

// A folder with fewer versioned files says nothing about what the version should be.
constexpr size_t kFewestSiblings = 4;

// Words by which protection software of any maker calls itself.
constexpr std::string_view kSecurityWords[] = {"antivirus",         "anti-virus",          "virus scanner",
                                               "antimalware",       "anti-malware",        "internet security",
                                               "endpoint security", "endpoint protection", "total security"};

struct VersionedFile {
  std::string jsonPath;
  std::string path;
  std::string version;
};

// By folder, in lower case.
std::map<std::string, std::vector<VersionedFile>> VersionedFiles(const Collection& collection) {
  std::map<std::string, std::vector<VersionedFile>> folders;
  ForEachProductFile(collection, [&](const Json::Value& file, const std::string& jsonPath) {
    VersionedFile versioned{jsonPath + ".version", TextOf(Member(file, "path")), TextOf(Member(file, "version"))};
    if (versioned.path.empty() || versioned.version.empty()) return;
    folders[LowerAscii(FolderOf(versioned.path))].push_back(std::move(versioned));
  });
  return folders;
}

// The version of at least three quarters of the files; empty when there is none.
std::string CommonVersion(const std::vector<VersionedFile>& files) {
  std::map<std::string, size_t> counts;
  for (const VersionedFile& file : files)
    ++counts[file.version];
  for (const auto& [version, count] : counts) {
    if (files.size() >= kFewestSiblings && count * 4 >= files.size() * 3) return version;
  }
  return {};
}

bool IsSecurityProduct(std::string_view name) {
  for (const std::string_view word : kSecurityWords) {
    if (ContainsNoCase(name, word)) return true;
  }
  return false;
}

}  // namespace

void FindMissingProduct(const Collection& collection, EvidenceList& found) {
  ForEachElement(Member(collection.Document(kManifestName), "collectors"),
                 [&](const Json::Value& collector, const std::string& path) {
                   if (TextOf(Member(collector, "name")) != "product_information") return;
                   if (TextOf(Member(collector, "outcome")) != "no data") return;
                   found.Add("collection_manifest.json", "collectors" + path + ".outcome", "no installed product");
                 });
}

void FindUnsignedProductProcesses(const Collection& collection, EvidenceList& found) {
  ForEachProcess(collection, [&](const Json::Value& process, const std::string& path) {
    const std::string executable = TextOf(Member(process, "ExecutablePath"));
    if (!IsFalse(Member(process, "signed")) || !IsProductFile(collection, executable)) return;
    found.Add(kTasksFile, path + ".signed", executable);
  });
}

void FindUnreadableProductFiles(const Collection& collection, EvidenceList& found) {
  ForEachProductFile(collection, [&](const Json::Value& file, const std::string& path) {
    const Json::Value& digest = Member(file, "md5");
    if (digest.isString() && TextOf(digest).empty())
      found.Add(kProductFile, path + ".md5", TextOf(Member(file, "path")));
  });
}

void FindDifferingVersions(const Collection& collection, EvidenceList& found) {
  for (const auto& [folder, files] : VersionedFiles(collection)) {
    const std::string common = CommonVersion(files);
    if (common.empty()) continue;
    for (const VersionedFile& file : files) {
      if (file.version == common) continue;
      found.Add(kProductFile, file.jsonPath, file.path + " has " + file.version + ", the others there " + common);
    }
  }
}

void FindForeignModules(const Collection& collection, EvidenceList& found) {
  const std::string windows = TextOf(Member(collection.Document("system_summary"), "Windows Directory"));
  if (windows.empty()) return;
  ForEachProcess(collection, [&](const Json::Value& process, const std::string& path) {
    if (!IsProductFile(collection, TextOf(Member(process, "ExecutablePath")))) return;
    ForEachElement(Member(process, "modules"), [&](const Json::Value& module, const std::string& index) {
      const std::string name = TextOf(Member(module, "name"));
      if (name.empty() || IsProductFile(collection, name) || LiesBelow(windows, name)) return;
      found.Add(kTasksFile, path + ".modules" + index, name + " in " + TextOf(Member(process, "Name")));
    });
  });
}

void FindProductNotRunning(const Collection& collection, EvidenceList& found) {
  const std::string location = InstallLocation(collection);
  bool hasPaths = false;
  bool runs = false;
  ForEachProcess(collection, [&](const Json::Value& process, const std::string&) {
    const std::string executable = TextOf(Member(process, "ExecutablePath"));
    hasPaths = hasPaths || !executable.empty();
    runs = runs || LiesBelow(location, executable);
  });
  if (!location.empty() && hasPaths && !runs) found.Add(kTasksFile, "processes", "no process runs from " + location);
}

void FindDuplicateProduct(const Collection& collection, EvidenceList& found) {
  std::map<std::string, size_t> names;
  ForEachElement(collection.Document("installed_software"), [&](const Json::Value& entry, const std::string& path) {
    if (TextOf(Member(entry, "Publisher")) != kPublisher) return;
    const std::string name = TextOf(Member(entry, "Name"));
    if (name.empty() || ++names[LowerAscii(name)] == 1) return;
    found.Add(kSoftwareFile, path, name + " " + TextOf(Member(entry, "Version")) + " is installed once more");
  });
}

void FindOtherSecurityProducts(const Collection& collection, EvidenceList& found) {
  ForEachElement(collection.Document("installed_software"), [&](const Json::Value& entry, const std::string& path) {
    const std::string publisher = TextOf(Member(entry, "Publisher"));
    const std::string name = TextOf(Member(entry, "Name"));
    if (publisher == kPublisher || !IsSecurityProduct(name)) return;
    found.Add(kSoftwareFile, path + ".Name", name + (publisher.empty() ? "" : " of " + publisher));
  });
}

void FindCrashDumps(const Collection& collection, EvidenceList& found) {
  // Dumps that the collection made itself lie beside the manifest.
  std::string own;
  for (const auto& [name, size] : collection.files) {
    if (FileNameOf(name) == "collection_manifest.json") own = FolderOf(name);
  }
  for (const auto& [name, size] : collection.files) {
    if (LowerAscii(name).ends_with(".dmp") && FolderOf(name) != own) found.Add(name, "", "a dump of a crash");
  }
}

}  // namespace report
