// The report's data, and the page that holds it.
#include "report/data_document.h"

#include <gmock/gmock.h>

#include <algorithm>
#include <string>

#include "report/overview.h"
#include "report/report_page.h"
#include "report/rules.h"
#include "report/tables/table_list.h"
#include "tests/support/report_documents.h"

namespace report {
namespace {

using testing::HasSubstr;
using testing::Not;

constexpr char kCase[] = R"({
  "collection_manifest": {"start": "2024-03-04T12:00:00Z", "collectors": [
    {"name": "printers", "outcome": "no data", "reason": "none"}, {"name": "registry", "outcome": "data"}]},
  "guiData": {"user_details": {"name": "Ann", "email": "ann@example.com"}, "issue": {"name": "slow",
    "description": "since </script><b>", "can_be_reproduced": true, "reproduce_start_time": 1709550000,
    "reproduce_stop_time": 1709553600}},
  "system_summary": {"System Name": "PC", "OS Name": "Windows", "OS Version": "10.0", "Time Zone": "(UTC+02:00) Somewhere",
    "Installed Physical Memory": 1610612736.0, "Available Physical Memory": 536870912.0},
  "storage": {"Partitions": [{"Drive Letter": "C:", "Size": "1000", "Free Space": "1"}, {"Size": null}]},
  "installed_software": [{"Name": "Shield", "Version": "3.1", "Publisher": "Quorvex"}],
  "windows_events": {"System": [{"TimeGenerated": "3/4/2024 09:05:07", "EventType": "1", "SourceName": "disk"}]}
})";

std::string DataOf(const Collection& collection) {
  return DataDocument(collection, {"a.zip", 5}, FindAll(collection), MakeTables(collection));
}

TEST(DataDocument, HoldsWhatThePageShows) {
  const Json::Value data = Parse(DataOf(MakeCollection(Parse(kCase))));
  EXPECT_EQ(data["version"], kDataVersion);
  EXPECT_EQ(data["source"], Parse(R"({"name": "a.zip", "bytes": 5, "collectedAt": "2024-03-04T12:00:00Z"})"));
  EXPECT_EQ(data["machine"], "PC, Windows (10.0), 1.5 GiB of memory");
  EXPECT_EQ(data["product"], "Shield 3.1");
  EXPECT_EQ(data["user"], Parse(R"([{"label": "Name", "value": "Ann"}, {"label": "E-mail", "value": "ann@example.com"},
      {"label": "Issue", "value": "slow"}, {"label": "Description", "value": "since </script><b>"},
      {"label": "Can be reproduced", "value": "yes"}])"));
  EXPECT_EQ(data["missing"], Parse(R"([{"what": "registry.json", "why": "was collected, see collectors[1]"},
      {"what": "printers.json", "why": "no data: none"}])"));
  EXPECT_EQ(data["gauges"], Parse(R"([{"name": "C:", "used": 999.0, "total": 1000.0, "kind": "disk"},
      {"name": "Memory", "used": 1073741824.0, "total": 1610612736.0, "kind": "memory"}])"));
  // The interval is moved into the zone of the events.
  EXPECT_EQ(data["timeline"], Parse(R"({"table": "events", "time": "time", "severity": "type", "from": 1709557200000,
      "to": 1709560800000})"));
  EXPECT_TRUE(data["comparison"].isNull());
  const Json::Value& finding = data["findings"][0];
  EXPECT_EQ(finding["id"], "storage-errors");
  EXPECT_EQ(finding["evidence"][0]["table"], "events");
  EXPECT_EQ(finding["evidence"][0]["row"], 0);
  const Json::Value& events = data["tables"][0];
  EXPECT_EQ(events["id"], "events");
  EXPECT_EQ(events["columns"][0], Parse(R"({"id": "time", "title": "Time", "type": "time"})"));
  EXPECT_EQ(events["rows"][0][0].asInt64(), 1709543107000);
  EXPECT_EQ(events["omitted"], 0);
}

TEST(DataDocument, TheZoneComesFromTheManifestElseFromItsName) {
  const struct {
    const char* documents;
    double hours;  // 99: not known
  } rows[] = {
      {R"({"collection_manifest": {"utc_offset_minutes": -210}, "system_summary": {"Time Zone": "(UTC+02:00) A"}})",
       -3.5},
      {R"({"collection_manifest": {"utc_offset_minutes": 9999}, "system_summary": {"Time Zone": "(UTC-03:30) A"}})",
       -3.5},
      {R"({"system_summary": {"Time Zone": "(UTC) Coordinated Universal Time"}})", 0},
      {R"({"system_summary": {"Time Zone": "(GMT+12:45) A"}})", 12.75},
      {R"({"system_summary": {"Time Zone": "(UTC+99:00) A"}})", 99},
      {R"({"system_summary": {"Time Zone": "(UTC+2) A"}})", 99},
      {R"({"system_summary": {"Time Zone": null}})", 99},
  };
  for (const auto& row : rows)
    EXPECT_EQ(MakeCollection(Parse(row.documents)).utcOffset.value_or(99 * 3600), row.hours * 3600) << row.documents;
}

TEST(DataDocument, NoDocumentMakesItThrowOrFallApart) {
  ForEachReplacement(Parse(kCase), [](const Json::Value& changed) {
    const std::string text = DataOf(MakeCollection(changed));
    Json::Value data;
    std::string error;
    ASSERT_TRUE(ParseJson(text, data, error)) << error << changed;
    ASSERT_TRUE(std::all_of(text.begin(), text.end(), [](char c) { return c == '\n' || (c >= ' ' && c < 0x7F); }))
        << changed;
  });
}

TEST(DataDocument, HostileTextsStayTextsWhereverTheyStand) {
  const std::string texts[] = {
      "</script><script>alert(1)</script>",   "<!--<script>", "]]>&lt;", std::string("\0\x01\x1F", 3),
      "\xE2\x80\xAE\xE2\x80\xA8\xE2\x80\xA9", "\\u003c\"\\"};
  for (const std::string& text : texts) {
    Json::Value documents = Parse(kCase);
    ForEachNode(documents, [&](Json::Value& node) {
      if (node.isString()) node = text;
    });
    documents["windows_events"][text].append(Json::Value(Json::objectValue))[text] = text;
    documents["x" + text][text] = text;
    const std::string html = EmbedData("<p><!--report-data--></p>", DataOf(MakeCollection(documents)));
    const std::string open = "<p><script type=\"application/json\" id=\"report-data\">";
    const std::string close = "</script></p>";
    ASSERT_TRUE(html.starts_with(open) && html.ends_with(close));
    const std::string data = html.substr(open.size(), html.size() - open.size() - close.size());
    EXPECT_EQ(data.find_first_of("<>&"), std::string::npos) << data;
    const Json::Value parsed = Parse(data);
    EXPECT_EQ(parsed["user"][3]["value"], text);
    const Json::Value& events = parsed["tables"][0]["rows"];
    const auto isOfLog = [&text](const Json::Value& row) { return row[2] == text; };
    EXPECT_TRUE(std::any_of(events.begin(), events.end(), isOfLog)) << events;
  }
}

TEST(DataDocument, WhatIsNoUtf8BecomesAReplacement) {
  Json::Value documents;
  documents["guiData"]["issue"]["name"] =
      "a\xFF"
      "b";
  const Json::Value data = Parse(DataOf(MakeCollection(documents)));
  EXPECT_THAT(data["user"][0]["value"].asString(), HasSubstr("\xEF\xBF\xBD"));
}

TEST(ReportPage, HasExactlyOnePlaceForTheData) {
  EXPECT_EQ(EmbedData("<html></html>", "{}"), "");
  EXPECT_EQ(EmbedData("", "{}"), "");
  EXPECT_EQ(EmbedData("<!--report-data--><!--report-data-->", "{}"), "");
  // Of the data, nothing is taken for a place.
  EXPECT_THAT(EmbedData("<!--report-data-->", R"({"a": "<!--report-data-->"})"), Not(HasSubstr("<!--")));
}

TEST(ReportPage, IsInTheProgram) {
  EXPECT_NE(EmbedData(ReportPage(), "{}"), "");
}

}  // namespace
}  // namespace report
