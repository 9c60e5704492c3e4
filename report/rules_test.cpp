#include "report/rules.h"

#include <gmock/gmock.h>

#include <set>
#include <stdexcept>
#include <string>

#include "report/findings_output.h"
#include "tests/support/report_documents.h"

namespace report {
namespace {

using testing::HasSubstr;

// One object, each member of which is a document. `manifest` is put under its long name; it gives the time of the
// collection too: 2024-03-04 12:00 UTC is 1709553600.
struct RuleRow {
  const char* id;
  const char* fires;
  const char* doesNotFire;
};

#define ST_START R"("collection_manifest": {"start": "2024-03-04T12:00:00Z"}, )"
#define ST_PRODUCT R"("product_information": {"install_location": "C:\\Program Files\\Quorvex"}, )"
#define ST_WINDOWS R"("system_summary": {"Windows Directory": "C:\\Windows"}, )"

const RuleRow kRows[] = {
    {"product-not-installed",
     R"({"collection_manifest": {"collectors": [{"name": "product_information", "outcome": "no data"}]}})",
     R"({"collection_manifest": {"collectors": [{"name": "services", "outcome": "no data"},
         {"name": "product_information", "outcome": "data"}]}})"},
    {"product-process-unsigned",
     "{" ST_PRODUCT
     R"("running_tasks": {"processes": [{"signed": false, "ExecutablePath": "c:\\program files\\QUORVEX\\a.exe"}]}})",
     "{" ST_PRODUCT R"("running_tasks": {"processes": [
        {"signed": true, "ExecutablePath": "C:\\Program Files\\Quorvex\\a.exe"}, {"ExecutablePath": null},
        {"signed": false, "ExecutablePath": "C:\\Program Files\\Quorvex2\\a.exe"}]}})"},
    {"product-file-unreadable", R"({"product_information": {"file_information": [{"path": "C:\\a.exe", "md5": ""}]}})",
     R"({"product_information": {"file_information": [{"path": "C:\\a.exe", "md5": "00"}, {"path": "C:\\b.exe"}]}})"},
    {"product-version-mismatch",
     R"({"product_information": {"file_information": [
        {"path": "C:\\Q\\a.exe", "version": "2.0"}, {"path": "C:\\Q\\b.exe", "version": "2.0"},
        {"path": "C:\\q\\c.exe", "version": "2.0"}, {"path": "C:\\Q\\d.exe", "version": "1.9"}]}})",
     R"({"product_information": {"file_information": [
        {"path": "C:\\Q\\a.exe", "version": "2.0"}, {"path": "C:\\Q\\b.exe", "version": "2.0"},
        {"path": "C:\\Q\\c.exe", "version": "2.0"}, {"path": "C:\\Q\\x\\d.exe", "version": "1.9"},
        {"path": "C:\\Q\\e.exe", "version": ""}]}})"},
    {"product-foreign-module",
     "{" ST_PRODUCT ST_WINDOWS
     R"("running_tasks": {"processes": [{"Name": "a.exe", "ExecutablePath": "C:\\Program Files\\Quorvex\\a.exe",
        "modules": [{"name": "D:\\hook.dll"}]}]}})",
     "{" ST_PRODUCT ST_WINDOWS
     R"("running_tasks": {"processes": [{"ExecutablePath": "C:\\Program Files\\Quorvex\\a.exe", "modules": [
        {"name": "C:\\WINDOWS\\System32\\ntdll.dll"}, {"name": "C:\\Program Files\\Quorvex\\b.dll"}]},
        {"ExecutablePath": "C:\\other.exe", "modules": [{"name": "D:\\hook.dll"}]}]}})"},
    {"product-not-running",
     "{" ST_PRODUCT R"("running_tasks": {"processes": [{"ExecutablePath": "C:\\Windows\\explorer.exe"}]}})",
     "{" ST_PRODUCT R"("running_tasks": {"processes": [{"ExecutablePath": null}, {"ProcessId": 4}]}})"},
    {"product-duplicate",
     R"({"installed_software": [{"Name": "Quorvex Security", "Publisher": "Quorvex"},
        {"Name": "quorvex security", "Publisher": "Quorvex", "Version": "2"}]})",
     R"({"installed_software": [{"Name": "Quorvex Security", "Publisher": "Quorvex"},
        {"Name": "Quorvex Backup", "Publisher": "Quorvex"}, {"Name": "Quorvex Security", "Publisher": null}]})"},
    {"other-security-product",
     R"({"installed_software": [{"Name": "Example AntiVirus Free", "Publisher": "Example"}]})",
     R"({"installed_software": [{"Name": "Quorvex Internet Security", "Publisher": "Quorvex"}, {"Name": "Editor"}]})"},
    {"update-old",
     "{" ST_START R"("product_information": {"last_update": {"Engine": {"update": {"time": "1708948799"}}}}})",
     "{" ST_START R"("product_information": {"last_update": {"Engine": {"update": {"time": "1708948800"}}}}})"},
    {"update-check-old", "{" ST_START R"("product_information": {"last_update": {"Engine": {"check": {"time": 1}}}}})",
     "{" ST_START R"("product_information": {"last_update": {"Engine": {"check": {"time": 1709553600}}, "x": 3}}})"},
    {"update-check-before-update",
     R"({"product_information": {"last_update": {"E": {"check": {"time": "1000"}, "update": {"time": "4601"}}}}})",
     R"({"product_information": {"last_update": {"E": {"check": {"time": "1000"}, "update": {"time": "4600"}}}}})"},
    {"update-in-future",
     "{" ST_START R"("product_information": {"last_update": {"E": {"update": {"time": "1709557201"}}}}})",
     "{" ST_START R"("product_information": {"last_update": {"E": {"update": {"time": "1709557200"}}}}})"},
    {"update-unknown",
     R"({"product_information": {"install_location": "C:\\Q", "last_update": {"E": {"update": null}}}})",
     R"({"product_information": {"install_location": "C:\\Q", "last_update": {"E": {"update": {"time": "1"}}}}})"},
    {"service-stopped", "{" ST_PRODUCT R"("services": [{"Name": "qxsvc", "State": "Stopped", "StartMode": "Auto",
        "PathName": "\"C:\\Program Files\\Quorvex\\svc.exe\" -run"}]})",
     "{" ST_PRODUCT R"("services": [
        {"State": "Running", "StartMode": "Auto", "PathName": "C:\\Program Files\\Quorvex\\svc.exe -run"},
        {"State": "Stopped", "StartMode": "Manual", "PathName": "C:\\Program Files\\Quorvex\\svc.exe"},
        {"State": "Stopped", "StartMode": "Auto", "PathName": "C:\\Windows\\svchost.exe C:\\Program Files\\Quorvex\\x"}]})"},
    {"service-disabled",
     "{" ST_PRODUCT
     R"("services": [{"StartMode": "Disabled", "PathName": "C:\\Program Files\\Quorvex\\svc.exe -run"}]})",
     "{" ST_PRODUCT R"("services": [{"StartMode": "Disabled", "PathName": "C:\\Windows\\other.exe"}]})"},
    {"driver-stopped", "{" ST_PRODUCT R"("system_drivers": [{"State": "Stopped", "StartMode": "System",
        "PathName": "\\??\\C:\\Program Files\\Quorvex\\qxflt.sys"}]})",
     "{" ST_PRODUCT R"("system_drivers": [{"State": "Stopped", "StartMode": "Boot", "Description": "A disk driver"},
        {"State": "Stopped", "StartMode": "Manual", "Description": "Quorvex filter"}]})"},
    {"process-in-temporary-folder",
     R"({"running_tasks": {"processes": [{"ExecutablePath": "C:\\Users\\a\\AppData\\Local\\Temp\\x\\setup.exe"}]}})",
     R"({"running_tasks": {"processes": [{"ExecutablePath": "C:\\Template\\temp"}]}})"},
    {"process-misplaced",
     "{" ST_WINDOWS R"("running_tasks": {"processes": [{"ExecutablePath": "C:\\Users\\a\\SvcHost.exe"}]}})",
     "{" ST_WINDOWS R"("running_tasks": {"processes": [{"ExecutablePath": "C:\\windows\\system32\\svchost.exe"}]}})"},
    {"startup-injected-library",
     R"({"startup_programs": [{"key": "HKEY_LOCAL_MACHINE\\Software\\Microsoft\\Windows NT\\CurrentVersion\\Windows",
        "name": "appinit_dlls", "value": "hook.dll"}]})",
     R"({"startup_programs": ["C:\\Startup\\a.lnk",
        {"key": "HKLM\\Software\\Microsoft\\Windows NT\\CurrentVersion\\Windows", "name": "appinit_dlls", "value": " "},
        {"key": "HKLM\\Software\\Microsoft\\Windows NT\\CurrentVersion\\Windows", "name": "spooler", "value": "yes"}]})"},
    {"startup-shell-replaced",
     R"({"startup_programs": [{"key": "HKLM\\Windows NT\\CurrentVersion\\Winlogon", "name": "shell", "value": "x.exe"}]})",
     R"({"startup_programs": [{"key": "HKLM\\X\\Winlogon", "name": "shell", "value": "Explorer.exe"},
        {"key": "HKLM\\X\\Winlogon", "name": "userinit", "value": "C:\\Windows\\system32\\userinit.exe,"}]})"},
    {"startup-from-temporary-folder",
     R"({"startup_programs": [{"key": "HKCU\\Software\\Run", "name": "x", "value": "C:\\Temp\\my tool.exe /s"}]})",
     R"({"startup_programs": [{"key": "HKCU\\Software\\Run", "name": "x", "value": "C:\\tool.exe C:\\Temp\\x"}]})"},
    {"startup-to-nowhere",
     R"({"product_information": {"install_location": "C:\\Q", "file_information": [{"path": "C:\\Q\\tray.exe"}]},
        "startup_programs": [{"key": "HKLM\\X\\Run", "name": "tray", "value": "C:\\Q\\old.exe"}]})",
     R"({"product_information": {"install_location": "C:\\Q", "file_information": [{"path": "C:\\Q\\tray.exe"}]},
        "startup_programs": [{"key": "HKLM\\X\\Run", "name": "tray", "value": "\"C:\\q\\Tray.exe\" /start"},
        {"key": "HKLM\\X\\Run", "name": "other", "value": "D:\\unknown.exe"},
        {"key": "HKLM\\X\\StartupApproved\\Run", "name": "y", "value": ""}]})"},
    {"product-crash",
     R"({"product_information": {"file_information": [{"path": "C:\\Q\\Engine.exe"}]}, "windows_events": {"Application": [
        {"SourceName": "Application Error", "EventType": "1", "InsertionStrings": ["engine.exe", "1.0"]}]}})",
     R"({"product_information": {"file_information": [{"path": "C:\\Q\\engine.exe"}]}, "windows_events": {"Application": [
        {"SourceName": "Application Error", "EventType": "1", "InsertionStrings": ["game.exe", null]},
        {"SourceName": "MsiInstaller", "EventType": "4", "InsertionStrings": ["engine.exe"]}]}})"},
    {"service-failure", "{" ST_PRODUCT R"("services": [{"Name": "qxsvc", "DisplayName": "Quorvex Service",
        "PathName": "C:\\Program Files\\Quorvex\\svc.exe"}], "windows_events": {"System": [
        {"SourceName": "Service Control Manager", "EventType": "1", "InsertionStrings": ["Quorvex Service", "1"]}]}})",
     "{" ST_PRODUCT R"("services": [{"Name": "qxsvc", "DisplayName": "Quorvex Service",
        "PathName": "C:\\Program Files\\Quorvex\\svc.exe"}], "windows_events": {"System": [
        {"SourceName": "Service Control Manager", "EventType": "4", "InsertionStrings": ["Quorvex Service"]},
        {"SourceName": "Service Control Manager", "EventType": "1", "InsertionStrings": ["Print Spooler"]}]}})"},
    {"storage-errors", R"({"windows_events": {"System": [{"SourceName": "disk", "EventType": "1"}]}})",
     R"({"windows_events": {"System": [{"SourceName": "disk", "EventType": "2"}, {"SourceName": "x", "EventType": "1"}]}})"},
    {"system-crash", R"({"windows_events": {"System": [{"SourceName": "BugCheck", "EventType": "1"}]}})",
     R"({"windows_events": {"System": [{"SourceName": "Microsoft-Windows-Kernel-Power", "EventType": "4"}]}})"},
    {"clock-jump",
     R"({"windows_events": {"System": [{"TimeGenerated": "3/4/2024 09:00:00"}, {"TimeGenerated": "3/4/2024 10:00:01"}]}})",
     "{" ST_START R"("windows_events": {"System": [{"TimeGenerated": "3/5/2024 03:00:00"},
        {"TimeGenerated": "3/5/2024 04:00:00"}, {"TimeGenerated": "yesterday"}, {"TimeGenerated": "1/5/2024 05:00:00"}]}})"},
    {"clock-jump", "{" ST_START R"("windows_events": {"Application": [{"TimeGenerated": "3/5/2024 04:00:01"}]}})",
     "{" ST_START R"("windows_events": {"Application": []}})"},
    {"disk-space-low", R"({"storage": {"Partitions": [{"Drive Letter": "D:", "Size": "1000", "Free Space": "99"}]}})",
     R"({"storage": {"Partitions": [{"Drive Letter": "D:", "Size": "1000", "Free Space": "100"},
        {"Drive Letter": "E:", "Size": null, "Free Space": null}, {"Drive Letter": "F:", "Size": "0", "Free Space": "0"},
        {"Drive Letter": "G:", "Size": "1000", "Free Space": "0", "File System": "CDFS"}]}})"},
    {"system-drive-full",
     "{" ST_WINDOWS
     R"("storage": {"Partitions": [{"Drive Letter": "C:", "Size": "9000000000", "Free Space": "1073741823"}]}})",
     "{" ST_WINDOWS
     R"("storage": {"Partitions": [{"Drive Letter": "C:", "Size": "9000000000", "Free Space": "1073741824"},
        {"Drive Letter": "D:", "Size": "9000000000", "Free Space": "0"}]}})"},
    {"memory-exhausted",
     R"({"system_summary": {"Installed Physical Memory": 1000.0, "Available Physical Memory": 49.0}})",
     R"({"system_summary": {"Installed Physical Memory": 1000.0, "Available Physical Memory": 50.0}})"},
    {"memory-small", R"({"system_summary": {"Installed Physical Memory": 2147483647.0}})",
     R"({"system_summary": {"Installed Physical Memory": 2147483648.0}})"},
    {"manifest-missing", R"({"services": []})", R"({"collection_manifest": {}})"},
    {"collector-failed",
     R"({"collection_manifest": {"collectors": [{"name": "storage", "outcome": "failed", "reason": "x"}]}})",
     R"({"collection_manifest": {"collectors": [{"name": "storage", "outcome": "no data"}]}})"},
    {"collector-failed",
     R"({"collection_manifest": {"collectors": [{"name": "storage", "outcome": "timed out", "reason": "x"}]}})",
     R"({"collection_manifest": {"collectors": [{"name": "storage", "outcome": "data"}]}})"},
    {"collector-not-written",
     R"({"collection_manifest": {"collectors": [{"name": "storage", "outcome": "not written"}]}})",
     R"({"collection_manifest": {"collectors": [{"name": "storage", "outcome": "failed"}, null]}})"},
    {"collector-errors",
     R"({"collection_manifest": {"collectors": [{"name": "storage", "errors": ["Query failed", "Again"]}]}})",
     R"({"collection_manifest": {"collectors": [{"name": "storage", "errors": []}]}})"},
    {"document-missing", R"({"collection_manifest": {"collectors": [{"name": "printers", "outcome": "data"}]}})",
     R"({"services": [], "collection_manifest": {"collectors": [{"name": "services", "outcome": "data"},
        {"name": "printers", "outcome": "no data"}]}})"},
};

const Rule& RuleNamed(std::string_view id) {
  for (const Rule& rule : RuleTable()) {
    if (rule.id == id) return rule;
  }
  throw std::invalid_argument("no such rule: " + std::string(id));
}

EvidenceList FoundBy(const Rule& rule, const Json::Value& documents) {
  EvidenceList found;
  rule.find(MakeCollection(documents), found);
  return found;
}

TEST(Rules, EachFiresOnItsCaseAndNotOnItsCounterpart) {
  for (const RuleRow& row : kRows) {
    SCOPED_TRACE(row.id);
    const EvidenceList found = FoundBy(RuleNamed(row.id), Parse(row.fires));
    ASSERT_EQ(found.Count(), 1u);
    EXPECT_THAT(found.Kept()[0].file, HasSubstr(".json"));
    EXPECT_NE(found.Kept()[0].text, "");
    EXPECT_EQ(FoundBy(RuleNamed(row.id), Parse(row.doesNotFire)).Count(), 0u);
  }
}

TEST(Rules, HaveUniqueIdsAndACaseEach) {
  // These have cases of their own below: they need more than small documents.
  std::set<std::string> tested = {"process-many-handles", "event-error-burst", "product-crash-dumps",
                                  "document-unreadable", "entry-left-out"};
  for (const RuleRow& row : kRows)
    tested.insert(row.id);
  std::set<std::string> ids;
  for (const Rule& rule : RuleTable())
    EXPECT_TRUE(ids.insert(rule.id).second) << rule.id;
  EXPECT_EQ(ids, tested);
}

// Every value of every case, one after another, becomes each type of value there is; all rules look at the result.
TEST(Rules, SurviveEveryTypeInEveryPlace) {
  for (const RuleRow& row : kRows) {
    SCOPED_TRACE(row.id);
    ForEachReplacement(Parse(row.fires), [](const Json::Value& changed) {
      EXPECT_NO_THROW(FindingsAsText(FindAll(MakeCollection(changed))));
    });
  }
}

TEST(Rules, ManyHandlesAreTenThousand) {
  Json::Value documents;
  Json::Value& process = documents["running_tasks"]["processes"].append(Json::Value(Json::objectValue));
  process["handles"].resize(9'999);
  EXPECT_EQ(FoundBy(RuleNamed("process-many-handles"), documents).Count(), 0u);
  process["handles"].resize(10'000);
  EXPECT_EQ(FoundBy(RuleNamed("process-many-handles"), documents).Count(), 1u);
}

TEST(Rules, AnErrorBurstIsTwentyErrorsWithinAnHourOfTheNewestRecord) {
  const auto events = [](int errors, const std::string& time) {
    Json::Value documents = Parse("{" ST_START R"("windows_events": {}})");
    Json::Value& log = documents["windows_events"]["System"];
    log.append(Parse(R"({"TimeGenerated": "3/4/2024 11:00:00", "EventType": "4"})"));
    for (int i = 0; i < errors; ++i) {
      Json::Value& event = log.append(Json::Value(Json::objectValue));
      event["TimeGenerated"] = time;
      event["EventType"] = "1";
    }
    return documents;
  };
  const Rule& rule = RuleNamed("event-error-burst");
  EXPECT_EQ(FoundBy(rule, events(20, "3/4/2024 10:00:00")).Count(), 1u);
  EXPECT_EQ(FoundBy(rule, events(19, "3/4/2024 10:00:00")).Count(), 0u);
  EXPECT_EQ(FoundBy(rule, events(20, "3/4/2024 09:59:59")).Count(), 0u);
  Json::Value later = events(20, "3/4/2024 10:00:00");
  later["collection_manifest"]["start"] = "2024-03-06T12:00:00Z";  // the burst was long before
  EXPECT_EQ(FoundBy(rule, later).Count(), 0u);
}

TEST(Rules, DumpsBesideTheManifestAreTheCollectionsOwn) {
  Collection collection;
  collection.files = {{"collected/collection_manifest.json"}, {"collected/svchost_7.dmp"}, {"Crashes/engine.DMP"}};
  EvidenceList found;
  RuleNamed("product-crash-dumps").find(collection, found);
  ASSERT_EQ(found.Count(), 1u);
  EXPECT_EQ(found.Kept()[0].file, "Crashes/engine.DMP");
}

TEST(Rules, WhatIsWrongWithThePackageIsFound) {
  Collection collection;
  AddDocument(collection, "services", std::string(10'000, '['));
  AddDocument(collection, "storage", "{}");
  collection.leftOut = {{"../x", "", "leads out of its folder"}};
  EvidenceList unreadable;
  RuleNamed("document-unreadable").find(collection, unreadable);
  ASSERT_EQ(unreadable.Count(), 1u);
  EXPECT_EQ(unreadable.Kept()[0].file, "services.json");
  EvidenceList leftOut;
  RuleNamed("entry-left-out").find(collection, leftOut);
  EXPECT_EQ(leftOut.Kept(), collection.leftOut);
}

TEST(Rules, FindingsComeGravestFirst) {
  const auto findings = FindAll(MakeCollection(
      Parse(R"({"collection_manifest": {"collectors": [{"name": "x", "outcome": "failed", "errors": ["e"]}]},
                "windows_events": {"System": [{"SourceName": "disk", "EventType": "1"}]}})")));
  std::vector<std::string> ids;
  ids.reserve(findings.size());
  for (const Finding& finding : findings)
    ids.push_back(finding.rule->id);
  EXPECT_THAT(ids, testing::ElementsAre("storage-errors", "collector-failed", "collector-errors"));
}

TEST(Rules, EvidenceBeyondTheLimitIsCounted) {
  Json::Value documents;
  for (int i = 0; i < 25; ++i)
    documents["running_tasks"]["processes"].append(Parse(R"({"ExecutablePath": "C:\\temp\\x.exe"})"));
  const EvidenceList found = FoundBy(RuleNamed("process-in-temporary-folder"), documents);
  EXPECT_EQ(found.Count(), 25u);
  EXPECT_EQ(found.Kept().size(), EvidenceList::kMost);
  EXPECT_THAT(FindingsAsText({{&RuleNamed("process-in-temporary-folder"), found}}), HasSubstr("and 5 more"));
}

}  // namespace
}  // namespace report
