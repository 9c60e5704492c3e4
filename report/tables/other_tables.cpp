#include <algorithm>
#include <string>

#include "report/json_access.h"
#include "report/tables/records.h"
#include "report/tables/table_functions.h"

namespace report {
namespace {

Table MakeOtherTable(const TableContext& context, const std::string& document, std::vector<Column> columns) {
  Table table = context.MakeTable("doc-" + document, std::move(columns));
  table.title = document;
  std::replace(table.title.begin(), table.title.end(), '_', ' ');
  return table;
}

// Takes a value apart into its texts, numbers and truth values, each with its place.
class Flattening {
 public:
  explicit Flattening(Table& table) : m_table(table) {}

  // NOLINTNEXTLINE(misc-no-recursion): as deep as a document, which has at most 1,000 levels
  void Add(const Json::Value& value) {
    if (value.isArray() && !value.empty()) {
      ForEachElement(value, [this](const Json::Value& element, const std::string& index) { AddBelow(index, element); });
    } else if (value.isObject() && !value.empty()) {
      ForEachMember(value, [this](const std::string& name, const Json::Value& member) { AddMember(name, member); });
    } else {
      AddRow(m_table, {Shortened(m_place, kLongestRowPath), TextCell(value)});
    }
  }

  // NOLINTNEXTLINE(misc-no-recursion)
  void AddMember(const std::string& name, const Json::Value& member) {
    AddBelow(m_place.empty() ? name : "." + name, member);
  }

 private:
  // NOLINTNEXTLINE(misc-no-recursion)
  void AddBelow(const std::string& step, const Json::Value& value) {
    const size_t length = m_place.size();
    m_place += step;
    Add(value);
    m_place.resize(length);
  }

  Table& m_table;
  std::string m_place;
};

bool IsArrayOfRecords(const Json::Value& value) {
  return value.isArray() && !value.empty() &&
         std::all_of(value.begin(), value.end(), [](const Json::Value& element) { return element.isObject(); });
}

void AddOtherDocument(TableContext& context, const std::string& name, const Json::Value& document) {
  if (IsArrayOfRecords(document)) {
    Table table = MakeOtherTable(context, name, {});
    AddRecords(table, name + ".json", "", document, {}, 0);
    context.Add(std::move(table));
    return;
  }
  Table table = MakeOtherTable(context, name, {{"place", "Place"}, {"value", "Value"}});
  table.flattened = name + ".json";
  Flattening flattening(table);
  if (document.isObject()) {
    ForEachMember(document, [&](const std::string& member, const Json::Value& value) {
      if (!context.taken.contains({name, member})) flattening.AddMember(member, value);
    });
  } else if (!document.empty()) {
    flattening.Add(document);
  }
  if (!table.rows.empty()) context.Add(std::move(table));
}

}  // namespace

void AddUpdateTimeTable(TableContext& context) {
  const Json::Value& updates = Member(context.collection.Document("product_information"), "last_update");
  if (!updates.isObject()) return;
  const double offset = context.collection.utcOffset.value_or(0);
  Table table{
      "productUpdates",
      "",
      {{"name", "Name"}, {"checked", "Last check", ColumnType::kTime}, {"updated", "Last update", ColumnType::kTime}}};
  table.flattened = "product_information.json";
  table.below = "last_update.";
  ForEachMember(updates, [&](const std::string& name, const Json::Value& update) {
    AddRow(table,
           {Shortened(name, kLongestCell), CellOf(Member(Member(update, "check"), "time"), Form::kUtcSeconds, offset),
            CellOf(Member(Member(update, "update"), "time"), Form::kUtcSeconds, offset)});
  });
  context.Add(std::move(table));
}

void AddPackageTable(TableContext& context) {
  Table table = context.MakeTable("package", {{"name", "Name"}, {"size", "Size", ColumnType::kBytes}});
  for (const PackageFile& file : context.collection.files)
    AddRow(table, {file.name, Json::UInt64{file.size}});
  context.Add(std::move(table));
}

void AddOtherTables(TableContext& context) {
  for (const auto& [name, document] : context.collection.documents) {
    if (context.tables.size() >= kMostTables) return;
    if (!context.taken.contains({name, ""})) AddOtherDocument(context, name, document);
  }
}

}  // namespace report
