#include <string>

#include "report/json_access.h"
#include "report/tables/table_functions.h"

namespace report {
namespace {

constexpr char kDocument[] = "registry";

// The keys in the order in which a tree shows them: each before its values and subkeys.
class RegistryRows {
 public:
  explicit RegistryRows(Table& table) : m_table(table) {}

  // NOLINTNEXTLINE(misc-no-recursion): as deep as a document, which has at most 1,000 levels
  void AddKey(const std::string& name, const Json::Value& key, const Cell& parent) {
    const Cell row = Json::UInt64{m_table.rows.size()};
    const bool isKey = key.isObject();
    if (!AddRow(m_table, {Shortened(name, kLongestCell), "key", isKey ? Cell() : TextCell(key), parent})) return;
    ForEachMember(key, [&](const std::string& member, const Json::Value& content) {
      if (member == "values" && content.isObject()) {
        ForEachMember(content, [&](const std::string& value, const Json::Value& text) { AddValue(value, text, row); });
      } else if (member == "subkeys" && content.isObject()) {
        ForEachMember(content, [&](const std::string& subkey, const Json::Value& dump) { AddKey(subkey, dump, row); });
      } else {
        AddValue(member, content, row);  // no dump of ours has it
      }
    });
  }

 private:
  void AddValue(const std::string& name, const Json::Value& text, const Cell& parent) {
    AddRow(m_table, {Shortened(name, kLongestCell), "value", TextCell(text), parent});
  }

  Table& m_table;
};

}  // namespace

void AddRegistryTable(TableContext& context) {
  const Json::Value& registry = context.collection.Document(kDocument);
  if (!registry.isObject()) return;
  context.Take(kDocument, "");
  Table table{
      "registry",
      "",
      {{"name", "Name"}, {"kind", "Kind"}, {"value", "Value"}, {"parentRow", "Parent's row", ColumnType::kNumber}}};
  table.parentColumn = "parentRow";
  RegistryRows rows(table);
  ForEachMember(registry, [&](const std::string& path, const Json::Value& key) { rows.AddKey(path, key, {}); });
  context.Add(std::move(table));
}

}  // namespace report
