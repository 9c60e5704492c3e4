#include "report/data_document.h"

#include <cmath>

#include "core/json.h"
#include "report/evidence_rows.h"
#include "report/findings_output.h"
#include "report/json_access.h"
#include "report/overview.h"

namespace report {
namespace {

const char* TypeName(ColumnType type) {
  switch (type) {
    case ColumnType::kText:
      return "text";
    case ColumnType::kNumber:
      return "number";
    case ColumnType::kBytes:
      return "bytes";
    case ColumnType::kTime:
      return "time";
    case ColumnType::kFlag:
      return "flag";
  }
  return "";
}

Json::Value Texts(const std::vector<LabelledText>& texts, const char* label, const char* text) {
  Json::Value list(Json::arrayValue);
  for (const LabelledText& item : texts) {
    Json::Value& entry = list.append(Json::Value(Json::objectValue));
    entry[label] = item.label;
    entry[text] = item.text;
  }
  return list;
}

Json::Value SourceMember(const ReportSource& source, const std::string& time) {
  Json::Value member(Json::objectValue);
  member["name"] = source.name;
  member["bytes"] = Json::UInt64{source.bytes};
  member["collectedAt"] = time.empty() ? Json::Value() : Json::Value(time);
  return member;
}

Json::Value ComparisonMember(const ComparedWith& compared) {
  Json::Value member(Json::objectValue);
  member["with"] = SourceMember(compared.other, compared.comparison.otherTime);
  member["otherIsOlder"] = compared.comparison.isOtherOlder;
  member["changes"] = Json::UInt64{compared.comparison.count};
  member["warnings"] = Json::Value(Json::arrayValue);
  for (const std::string& warning : compared.comparison.warnings)
    member["warnings"].append(warning);
  member["notCompared"] = Texts(compared.comparison.notCompared, "what", "why");
  return member;
}

Json::Value FindingsMember(const std::vector<Finding>& findings, const std::vector<Table>& tables) {
  EvidenceRows rows(tables);
  Json::Value list(Json::arrayValue);
  for (const Finding& finding : findings) {
    Json::Value& entry = list.append(FindingAsJson(finding));
    for (Json::ArrayIndex i = 0; i < entry["evidence"].size(); ++i) {
      const EvidenceRow found = rows.Find(finding.evidence.Kept()[i]);
      Json::Value& item = entry["evidence"][i];
      for (Json::Value& text : item)
        text = TextCell(text);
      item["table"] = found.table != nullptr ? Json::Value(found.table->id) : Json::Value();
      item["row"] = found.row ? Json::Value(Json::UInt64{*found.row}) : Json::Value();
    }
  }
  return list;
}

Json::Value GaugesMember(const Collection& collection) {
  Json::Value list(Json::arrayValue);
  for (const Gauge& gauge : Gauges(collection)) {
    Json::Value& entry = list.append(Json::Value(Json::objectValue));
    entry["name"] = gauge.name;
    entry["used"] = gauge.used;
    entry["total"] = gauge.total;
    entry["kind"] = gauge.isMemory ? "memory" : "disk";
  }
  return list;
}

Json::Value TimelineMember(const Collection& collection, const std::vector<Table>& tables) {
  for (const Table& table : tables) {
    if (table.id != "events") continue;
    const Interval interval = ReproductionInterval(collection);
    Json::Value timeline(Json::objectValue);
    timeline["table"] = table.id;
    timeline["time"] = "time";
    timeline["severity"] = "type";
    timeline["from"] = interval.from ? TimeCell(*interval.from) : Json::Value();
    timeline["to"] = interval.to ? TimeCell(*interval.to) : Json::Value();
    return timeline;
  }
  return {};
}

// The head of a table, up to its rows.
std::string TableHead(const Table& table) {
  Json::Value head(Json::objectValue);
  head["id"] = table.id;
  head["title"] = table.title;
  if (!table.parentColumn.empty()) head["parent"] = table.parentColumn;
  Json::Value& columns = head["columns"] = Json::Value(Json::arrayValue);
  for (const Column& column : table.columns) {
    Json::Value& entry = columns.append(Json::Value(Json::objectValue));
    entry["id"] = column.id;
    entry["title"] = column.title;
    entry["type"] = TypeName(column.type);
  }
  std::string text = WriteCompactJson(head);
  text.resize(text.rfind('}'));
  return text;
}

void AppendRows(std::string& text, const Table& table) {
  size_t omitted = table.omitted;
  text += ",\"rows\":[";
  bool isFirst = true;
  for (const Row& row : table.rows) {
    if (text.size() >= kLargestData) {
      ++omitted;
      continue;
    }
    text += isFirst ? "[" : ",[";
    isFirst = false;
    for (size_t column = 0; column < row.size(); ++column) {
      if (column > 0) text += ',';
      AppendJsonScalar(text, row[column]);
    }
    text += ']';
  }
  text += "],\"omitted\":" + std::to_string(omitted) + "}";
}

}  // namespace

std::string DataDocument(const Collection& collection, const ReportSource& source, const std::vector<Finding>& findings,
                         std::vector<Table> tables, const ComparedWith* compared) {
  if (compared != nullptr) tables.insert(tables.begin(), ChangesTable(compared->comparison));
  const std::string start = TextOf(Member(collection.Document(kManifestName), "start"));
  Json::Value head(Json::objectValue);
  head["version"] = kDataVersion;
  head["tool"] = "support_report " ST_VERSION;
  head["source"] = SourceMember(source, collection.collectedAt ? start : "");
  head["machine"] = MachineLine(collection);
  head["product"] = ProductLine(collection);
  head["user"] = Texts(UserWords(collection), "label", "value");
  head["missing"] = Texts(MissingParts(collection), "what", "why");
  head["findings"] = FindingsMember(findings, tables);
  head["gauges"] = GaugesMember(collection);
  head["timeline"] = TimelineMember(collection, tables);
  head["comparison"] = compared != nullptr ? ComparisonMember(*compared) : Json::Value();
  std::string text = WriteCompactJson(head);
  text.resize(text.rfind('}'));
  text += ",\"tables\":[";
  for (size_t i = 0; i < tables.size(); ++i) {
    if (i > 0) text += ',';
    text += TableHead(tables[i]);
    AppendRows(text, tables[i]);
    tables[i].rows = {};
  }
  return text + "]}\n";
}

}  // namespace report
