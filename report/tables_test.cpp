// The tables of a report: what each makes of its documents, and what no document can do to it.
#include <gmock/gmock.h>

#include <string>
#include <vector>

#include "report/evidence_rows.h"
#include "report/json_access.h"
#include "report/tables/records.h"
#include "report/tables/table_list.h"
#include "tests/support/report_documents.h"

namespace report {
namespace {

using testing::ElementsAre;

const Table* TableNamed(const std::vector<Table>& tables, std::string_view id) {
  for (const Table& table : tables) {
    if (table.id == id) return &table;
  }
  return nullptr;
}

std::string AsJson(const Table& table, size_t row) {
  std::string text;
  for (const Cell& cell : table.rows.at(row)) {
    text += text.empty() ? "" : ",";
    AppendJsonScalar(text, cell);
  }
  return text;
}

// One of everything that the collectors write.
constexpr char kEverything[] = R"({
  "collection_manifest": {"start": "2024-03-04T12:00:00Z", "utc_offset_minutes": 60,
    "collectors": [{"name": "services", "outcome": "data", "records": 1, "errors": ["e"]}]},
  "running_tasks": {"processes": [
    {"Name": "a.exe", "ProcessId": 8, "ParentProcessId": 4, "signed": true, "User": "M\\u", "modules": [{"name": "C:\\a.dll"}],
     "handles": [{"type": "Key"}, {"type": "Key"}, {"type": "File"}], "Threads": 7},
    {"Name": "System", "ProcessId": 4, "ParentProcessId": 0}]},
  "windows_events": {
    "Application": [{"TimeGenerated": "3/4/2024 09:05:07", "EventType": "1", "SourceName": "s", "InsertionStrings": ["x", "y"]}],
    "System": [{"TimeGenerated": "yesterday", "EventType": "77", "message": "m"}]},
  "startup_programs": [{"key": "HKLM\\Run", "name": "n", "value": "v"}, "C:\\Startup\\a.lnk"],
  "installed_software": [{"Name": "Editor", "Version": "2", "InstallDate": "20240304"}],
  "installed_updates": [{"Name": "KB1", "Program": "p", "InstallDate": "soon"}],
  "services": [{"Name": "svc", "State": "Running"}],
  "system_drivers": [{"Name": "drv", "Started": -1, "AcceptStop": 0}],
  "network": [{"LocalName": "Z:", "RemoteName": "\\\\s\\x"}],
  "registry": {"HKLM\\Q": {"values": {"a": "1"}, "subkeys": {"S": {"values": {"b": "2"}}}}},
  "product_information": {"install_location": "C:\\Q", "file_information": [{"path": "C:\\Q\\a.exe", "version": "1", "md5": ""}],
    "last_update": {"Engine": {"check": {"time": "1709553600"}, "update": {"time": null}}},
    "smart_db": [{"latime": 133539480000000000, "lstime": 0, "path": "C:\\x"}]},
  "storage": {"Partitions": [{"Drive Letter": "C:", "Size": "1000", "Free Space": "99"}], "Disks": [{"Model": "d"}]},
  "system_summary": {"System Name": "PC", "Nested": {"a": [1, {"b": null}]}},
  "printers": [{"Name": "p"}, {"PortName": "q"}],
  "unknown_tool": [1, "two"]
})";

TEST(Tables, EachShowsWhatItsDocumentHolds) {
  const Collection collection = MakeCollection(Parse(kEverything));
  const std::vector<Table> tables = MakeTables(collection);
  const struct {
    const char* id;
    size_t row;
    const char* cells;
  } rows[] = {
      {"processes", 0, R"("a.exe",8,4,"M\\u",true,null,null,null,null,null,null,1,3,"7",1)"},
      {"processes", 1, R"("System",4,0,null,null,null,null,null,null,null,null,null,null,null,null)"},
      {"events", 0, R"(1709543107000,"error","Application","s",null,"[\"x\",\"y\"]",null)"},
      {"events", 1, R"("yesterday","77","System",null,"m",null,null)"},
      {"startup", 0, R"("v","n","HKLM\\Run")"},
      {"startup", 1, R"("C:\\Startup\\a.lnk",null,null)"},
      {"software", 0, R"("Editor","2",null,1709510400000)"},
      {"updates", 0, R"("KB1","p","soon")"},
      {"services", 0, R"("svc",null,"Running",null,null,null,null)"},
      {"drivers", 0, R"("drv",null,null,null,null,null,true,null,false)"},
      {"network", 0, R"("Z:","\\\\s\\x",null,null,null,null)"},
      {"registry", 0, R"("HKLM\\Q","key",null,null)"},
      {"registry", 1, R"("S","key",null,0)"},
      {"registry", 2, R"("b","value","2",1)"},
      {"registry", 3, R"("a","value","1",0)"},
      {"files", 0, R"("C:\\Q\\a.exe","1","")"},
      {"productUpdates", 0, R"("Engine",1709557200000,null)"},
      {"package", 0, R"("collected/collection_manifest.json",10)"},
      {"collectors", 0, R"("services","data",null,1,null,null,"[\"e\"]",null)"},
      {"partitions", 0, R"("C:",null,1000,99,null,null,null,null)"},
      {"disks", 0, R"("d",null,null)"},
      {"modules", 0, R"("C:\\a.dll","a.exe",8)"},
      {"handles", 1, R"("Key",2,"a.exe",8)"},
      {"scanCache", 0, R"("C:\\x",1709478000000,"0")"},
      {"doc-system_summary", 0, R"("Nested.a[0]","1")"},
      {"doc-system_summary", 1, R"("Nested.a[1].b",null)"},
      {"doc-product_information", 0, R"("install_location","C:\\Q")"},
      {"doc-printers", 1, R"(null,"q")"},
      {"doc-unknown_tool", 1, R"("[1]","two")"},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(std::string(row.id) + " " + std::to_string(row.row));
    const Table* const table = TableNamed(tables, row.id);
    ASSERT_NE(table, nullptr);
    EXPECT_EQ(AsJson(*table, row.row), row.cells);
  }
}

TEST(Tables, EveryRowHasACellForEachColumnWhateverADocumentHolds) {
  ForEachReplacement(Parse(kEverything), [](const Json::Value& changed) {
    const Collection collection = MakeCollection(changed);
    for (const Table& table : MakeTables(collection)) {
      EXPECT_LE(table.columns.size(), kMostColumns + 1) << table.id;
      for (const Row& row : table.rows) {
        ASSERT_EQ(row.size(), table.columns.size()) << table.id << changed;
        for (const Cell& cell : row)
          ASSERT_FALSE(cell.isArray() || cell.isObject()) << table.id << changed;
      }
    }
  });
}

TEST(Tables, NoTextOfADocumentIsLost) {
  ForEachReplacement(Parse(kEverything), [](const Json::Value& changed) {
    Json::Value marked = changed;
    std::vector<std::string> texts;
    ForEachNode(marked, [&](Json::Value& node) {
      if (!node.isString()) return;
      texts.push_back("mark" + std::to_string(texts.size()) + ";");
      node = texts.back();
    });
    std::string shown;
    for (const Table& table : MakeTables(MakeCollection(marked))) {
      for (const Row& row : table.rows) {
        for (const Cell& cell : row)
          AppendJsonScalar(shown, cell);
      }
    }
    for (const std::string& text : texts)
      ASSERT_NE(shown.find(text), std::string::npos) << text << marked;
  });
}

TEST(Tables, CirclesOfParentsAreCutAndUnknownParentsAreRoots) {
  const std::vector<Table> tables = MakeTables(MakeCollection(Parse(R"({"running_tasks": {"processes": [
      {"ProcessId": 1, "ParentProcessId": 2}, {"ProcessId": 2, "ParentProcessId": 3}, {"ProcessId": 3, "ParentProcessId": 1},
      {"ProcessId": 4, "ParentProcessId": 4}, {"ProcessId": 5, "ParentProcessId": 3}, {"ProcessId": 6, "ParentProcessId": 99},
      {"ProcessId": 1, "ParentProcessId": 5}, 7]}})")));
  const Table* const table = TableNamed(tables, "processes");
  ASSERT_NE(table, nullptr);
  std::vector<std::string> parents;
  for (const Row& row : table->rows)
    parents.push_back(TextOf(TextCell(row[table->ColumnIndex(table->parentColumn)])));
  EXPECT_THAT(parents, ElementsAre("1", "2", "", "", "2", "", "4", ""));
}

TEST(Tables, WhatIsTooMuchIsCutAndCounted) {
  Json::Value documents;
  Json::Value& wide = documents["wide"].append(Json::Value(Json::objectValue));
  for (int i = 0; i < 100; ++i)
    wide["m" + std::to_string(i)] = i;
  documents["long"]["text"] = std::string(kLongestCell, 'a') + "\xC3\xB6";
  documents["long"][std::string(2000, 'n')] = 1;
  documents["many"].resize(kMostRows + 5);
  const std::vector<Table> tables = MakeTables(MakeCollection(documents));
  EXPECT_EQ(TableNamed(tables, "doc-wide")->columns.size(), kMostColumns);
  const Table& text = *TableNamed(tables, "doc-long");
  EXPECT_EQ(TextOf(text.rows[0][0]), std::string(kLongestRowPath, 'n') + "...");
  EXPECT_EQ(TextOf(text.rows[1][1]), std::string(kLongestCell, 'a') + "...");
  EXPECT_EQ(TableNamed(tables, "doc-many")->rows.size(), kMostRows);
  EXPECT_EQ(TableNamed(tables, "doc-many")->omitted, 5u);
}

TEST(Tables, ADocumentOfAThousandLevelsIsFlattened) {
  const std::string deep = std::string(990, '[') + "\"bottom\"" + std::string(990, ']');
  const std::vector<Table> tables =
      MakeTables(MakeCollection(Parse("{\"deep\": " + deep + ", \"services\": " + deep + "}")));
  EXPECT_EQ(TextOf(TableNamed(tables, "doc-deep")->rows.at(0).at(1)), "bottom");
  EXPECT_EQ(TextOf(TableNamed(tables, "services")->rows.at(0).at(0)),
            deep.substr(2, deep.size() - 4).insert(0, "[").append("]"));
}

TEST(EvidenceRows, LeadToTheRowThatShowsThePlace) {
  const std::vector<Table> tables = MakeTables(MakeCollection(Parse(kEverything)));
  EvidenceRows rows(tables);
  const struct {
    const char* file;
    const char* path;
    const char* table;  // null: none
    std::optional<size_t> row;
  } cases[] = {
      {"running_tasks.json", "processes[1].signed", "processes", 1},
      {"running_tasks.json", "processes", "processes", std::nullopt},
      {"running_tasks.json", "processes[2]", "processes", std::nullopt},
      {"running_tasks.json", "processes[x]", nullptr, std::nullopt},
      {"windows_events.json", "System[0].TimeGenerated", "events", 1},
      {"windows_events.json", "System", "events", std::nullopt},
      {"services.json", "[0].State", "services", 0},
      {"storage.json", "Partitions[0].Free Space", "partitions", 0},
      {"system_summary.json", "System Name", "doc-system_summary", 2},
      {"system_summary.json", "Nested.a[1].b.c", "doc-system_summary", 1},
      {"product_information.json", "last_update.Engine.update.time", "productUpdates", 0},
      {"product_information.json", "file_information[0].md5", "files", 0},
      {"collection_manifest.json", "collectors[0].errors", "collectors", 0},
      {"services.json", "", "package", 8},
      {"collected/storage.json", "", "package", 10},
      {"absent.json", "", nullptr, std::nullopt},
  };
  for (const auto& row : cases) {
    SCOPED_TRACE(std::string(row.file) + " " + row.path);
    const EvidenceRow found = rows.Find({row.file, row.path, ""});
    EXPECT_EQ(found.table == nullptr ? "" : found.table->id, row.table == nullptr ? "" : row.table);
    EXPECT_EQ(found.row, row.row);
  }
}

}  // namespace
}  // namespace report
