// What changed between two collections of one machine.
#include "report/comparison/comparison.h"

#include <gmock/gmock.h>

#include <string>
#include <vector>

#include "report/findings_output.h"
#include "report/tables/table_list.h"
#include "tests/support/report_documents.h"

namespace report {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

Comparison CompareDocuments(const Json::Value& newer, const Json::Value& older) {
  const Collection collection = MakeCollection(newer);
  const Collection other = MakeCollection(older);
  return Compare({collection, MakeTables(collection)}, {other, MakeTables(other)});
}

// "changed|Services|svc|Start|Auto|Disabled"
std::vector<std::string> Lines(const Comparison& comparison) {
  std::vector<std::string> lines;
  for (const Change& change : comparison.changes) {
    lines.push_back(std::string(ChangeKindName(change.kind)) + "|" + change.table + "|" + change.item + "|" +
                    change.field + "|" + change.before + "|" + change.after);
  }
  return lines;
}

struct PairOfDocuments {
  const char* before;
  const char* after;
  std::vector<std::string> changes;
};

const PairOfDocuments kRows[] = {
    // Rows are paired by name, whatever their order and the case of letters.
    {R"({"services": [{"Name": "a", "StartMode": "Auto"}, {"Name": "b", "State": "Running"}, {"Name": "c"}]})",
     R"({"services": [{"Name": "d"}, {"Name": "B", "State": "Stopped"}, {"Name": "A", "StartMode": "Auto"}]})",
     {"changed|Services|b|State|Running|Stopped", "removed|Services|c|||", "added|Services|d|||"}},
    {R"({"installed_software": [{"Name": "E", "Version": "1", "InstallDate": "20240101"}, {"Name": "F", "Version": "7"}]})",
     R"({"installed_software": [{"Name": "F", "Version": "7"}, {"Name": "E", "Version": "2", "InstallDate": "20240304"}]})",
     {"changed|Installed software|E|Version|1|2"}},
    // Of several rows of one name those that are alike are paired first.
    {R"({"installed_software": [{"Name": "R", "Version": "1"}, {"Name": "R", "Version": "2"}]})",
     R"({"installed_software": [{"Name": "R", "Version": "3"}, {"Name": "R", "Version": "2"}]})",
     {"changed|Installed software|R|Version|1|3"}},
    {R"({"installed_software": [{"Name": "R", "Version": "1"}, {"Name": "R", "Version": "2"}]})",
     R"({"installed_software": [{"Name": "R", "Version": "2"}, {"Name": "R", "Version": "2"}]})",
     {"removed|Installed software|R||1|"}},
    {R"({"installed_updates": [{"Name": "KB1", "InstallDate": "20240101"}]})",
     R"({"installed_updates": [{"Name": "KB1", "InstallDate": "20240202"}, {"Name": "KB2"}]})",
     {"added|Installed updates|KB2|||"}},
    {R"({"system_drivers": [{"Name": "d", "PathName": "C:\\d.sys"}]})",
     R"({"system_drivers": [{"Name": "d", "PathName": "C:\\e.sys"}]})",
     {R"(changed|Drivers|d|Path|C:\d.sys|C:\e.sys)"}},
    // Which programs ran, not how often and under which identifier.
    {R"({"running_tasks": {"processes": [{"ProcessId": 1, "Name": "a.exe", "ExecutablePath": "C:\\a.exe", "md5": "0", "signed": true},
        {"ProcessId": 2, "Name": "b.exe", "ExecutablePath": "C:\\b.exe"}]}})",
     R"({"running_tasks": {"processes": [{"ProcessId": 7, "Name": "a.exe", "ExecutablePath": "c:\\A.EXE", "md5": "1", "signed": false},
        {"ProcessId": 8, "Name": "a.exe", "ExecutablePath": "C:\\a.exe", "md5": "1", "signed": false, "handles": [1]}]}})",
     {R"(changed|Processes|C:\a.exe, a.exe|Signed|true|false)", R"(changed|Processes|C:\a.exe, a.exe|MD5|0|1)",
      R"(removed|Processes|C:\b.exe, b.exe|||)"}},
    {R"({"startup_programs": [{"key": "HKLM\\Run", "name": "n", "value": "old"}, "C:\\S\\a.lnk"]})",
     R"({"startup_programs": ["C:\\S\\b.lnk", {"key": "HKLM\\Run", "name": "n", "value": "new"}, "C:\\S\\a.lnk"]})",
     {R"(added|Startup programs|C:\S\b.lnk|||)", R"(changed|Startup programs|HKLM\Run, n|Program|old|new)"}},
    {R"({"product_information": {"file_information": [{"path": "C:\\Q\\a.dll", "version": "1", "md5": "00"}]}})",
     R"({"product_information": {"file_information": [{"path": "C:\\Q\\a.dll", "version": "1", "md5": "01"}]}})",
     {R"(changed|Product files|C:\Q\a.dll|MD5|00|01)"}},
    // A key that is new or gone is one change; a value is named by its whole path.
    {R"({"registry": {"HKLM\\Q": {"values": {"a": "1", "b": "2"}, "subkeys": {"S": {"values": {"x": "1"}}, "T": {}}}}})",
     R"({"registry": {"hklm\\q": {"values": {"A": "3", "c": "4"}, "subkeys": {"s": {"values": {"x": "1"}}, "U": {"values": {"y": "1"}}}}}})",
     {R"(changed|Registry|HKLM\Q\a|Value|1|3)", R"(removed|Registry|HKLM\Q\b||2|)", R"(added|Registry|HKLM\Q\c|||4)",
      R"(removed|Registry|HKLM\Q\T|||)", R"(added|Registry|HKLM\Q\U|||)"}},
    {R"({"storage": {"Partitions": [{"Drive Letter": "C:", "Size": "1000", "Free Space": "9"}]}})",
     R"({"storage": {"Partitions": [{"Drive Letter": "C:", "Size": "2000", "Free Space": "3"}, {"Drive Letter": "D:"}]}})",
     {"changed|Drives|C:|Size|1000|2000", "added|Drives|D:|||"}},
    {R"({"system_summary": {"OS Version": "10", "Available Physical Memory": 5.0, "Installed Physical Memory": 8.0}})",
     R"({"system_summary": {"OS Version": "11", "Available Physical Memory": 6.0, "Installed Physical Memory": 16.0}})",
     {"changed|system summary|Installed Physical Memory|Value|8|16", "changed|system summary|OS Version|Value|10|11"}},
    {R"({"windows_events": {"System": [{"SourceName": "a"}]}})", R"({"windows_events": {"System": []}})", {}},
};

TEST(Comparison, PairsRowsByTheirNamesAndPassesOverWhatDoesNotLast) {
  for (const PairOfDocuments& row : kRows) {
    SCOPED_TRACE(row.before);
    const Comparison comparison = CompareDocuments(Parse(row.after), Parse(row.before));
    EXPECT_THAT(Lines(comparison), testing::UnorderedElementsAreArray(row.changes));
    EXPECT_EQ(comparison.count, row.changes.size());
    EXPECT_THAT(Lines(CompareDocuments(Parse(row.after), Parse(row.after))), IsEmpty());
  }
}

TEST(Comparison, SurvivesEveryTypeInEveryPlace) {
  for (const PairOfDocuments& row : kRows) {
    ForEachReplacement(Parse(row.before), [&](const Json::Value& changed) {
      const Comparison comparison = CompareDocuments(Parse(row.after), changed);
      EXPECT_NO_THROW(FindingsAsText({}, &comparison));
      EXPECT_NO_THROW(FindingsAsJson({}, &comparison));
      EXPECT_NO_THROW(CompareDocuments(changed, Parse(row.after)));
    });
  }
}

TEST(Comparison, TheOlderCollectionComesFirst) {
  const Json::Value early =
      Parse(R"({"collection_manifest": {"start": "2024-03-04T12:00:00Z"}, "services": [{"Name": "a"}]})");
  const Json::Value late = Parse(R"({"collection_manifest": {"start": "2024-03-05T12:00:00Z"}, "services": []})");
  for (const bool isOtherOlder : {true, false}) {
    const Comparison comparison = isOtherOlder ? CompareDocuments(late, early) : CompareDocuments(early, late);
    EXPECT_EQ(comparison.isOtherOlder, isOtherOlder);
    EXPECT_EQ(comparison.otherTime, isOtherOlder ? "2024-03-04T12:00:00Z" : "2024-03-05T12:00:00Z");
    EXPECT_THAT(Lines(comparison), ElementsAre("removed|Services|a|||"));
  }
}

TEST(Comparison, WhatIsInOneCollectionOnlyIsNotTakenForAChange) {
  const Comparison comparison =
      CompareDocuments(Parse(R"({"services": [{"Name": "a"}]})"), Parse(R"({"registry": {"HKLM\\Q": {}}})"));
  EXPECT_THAT(comparison.changes, IsEmpty());
  ASSERT_EQ(comparison.notCompared.size(), 2u);
  EXPECT_EQ(comparison.notCompared[0].label + ": " + comparison.notCompared[0].text,
            "Services: not in the older collection");
  EXPECT_EQ(comparison.notCompared[1].label + ": " + comparison.notCompared[1].text,
            "Registry: not in the newer collection");
}

TEST(Comparison, WarnsOfDifferentMachines) {
  const auto warnings = [](const char* name, const char* model) {
    Json::Value documents = Parse(R"({"collection_manifest": {"start": "2024-03-04T12:00:00Z"}})");
    documents["system_summary"]["System Name"] = name;
    documents["system_summary"]["System Model"] = model;
    const Json::Value other = Parse(R"({"collection_manifest": {"start": "2024-03-04T12:00:00Z"},
        "system_summary": {"System Name": "PC", "System Model": "M"}})");
    return CompareDocuments(documents, other).warnings;
  };
  EXPECT_THAT(warnings("pc", "M"), IsEmpty());
  EXPECT_THAT(warnings("PC2", "M"), ElementsAre(HasSubstr("different machines (System Name: PC and PC2)")));
  EXPECT_THAT(warnings("PC", "N"), ElementsAre(HasSubstr("System Model: M and N")));
  EXPECT_THAT(warnings("", ""), ElementsAre(HasSubstr("cannot be told")));
}

TEST(Comparison, IsShownAsTextJsonAndTable) {
  Comparison comparison = CompareDocuments(Parse(R"({"services": [{"Name": "a\u001b[2J", "StartMode": "Auto"}]})"),
                                           Parse(R"({"services": [{"Name": "a\u001b[2J", "StartMode": "Manual"}]})"));
  comparison.count += 3;
  const std::string text = FindingsAsText({}, &comparison);
  EXPECT_THAT(text, HasSubstr("Nothing found.\n"));
  EXPECT_THAT(text, HasSubstr("  - changed: Services: a?[2J, Start: Manual -> Auto\n  - and 3 more\n"));
  EXPECT_THAT(text, HasSubstr("\nChanges: 4\n"));
  const Json::Value json = Parse(FindingsAsJson({}, &comparison));
  EXPECT_EQ(json["comparison"]["count"], 4);
  EXPECT_EQ(json["comparison"]["changes"][0], Parse(R"({"kind": "changed", "table": "Services", "item": "a\u001b[2J",
      "field": "Start", "before": "Manual", "after": "Auto"})"));
  const Table table = ChangesTable(comparison);
  EXPECT_EQ(table.rows.at(0).at(5), "Auto");
  EXPECT_EQ(table.omitted, 3u);
}

}  // namespace
}  // namespace report
