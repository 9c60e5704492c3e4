#include "systeminfo/wmi_table.h"

#include "core/logging.h"
#include "core/text.h"

namespace systeminfo {
namespace {

WMIWrapper::Names PropertiesOf(const WmiTable& table) {
  WMIWrapper::Names names;
  for (const WmiColumn& column : table.columns)
    names.emplace_back(column.property);
  return names;
}

// `valueAt` gives the value of the column with that index.
template <class ValueAt>
Json::Value MakeObject(const WmiTable& table, ValueAt valueAt) {
  Json::Value object(Json::objectValue);
  for (size_t i = 0; i < table.columns.size(); ++i) {
    const WmiColumn& column = table.columns[i];
    object[ToUtf8(column.member == nullptr ? column.property : column.member)] = valueAt(i);
  }
  return object;
}

bool ReadWithNulls(WMIWrapper& wmi, const WmiTable& table, Json::Value& rows) {
  WMIWrapper::Rows instances;
  const int result = wmi.ExecuteQuery(table.query, PropertiesOf(table), instances);
  for (WMIWrapper::Row& instance : instances)
    rows.append(MakeObject(table, [&](size_t i) { return instance[table.columns[i].property]; }));
  return result == 0;
}

bool ReadWholeRows(WMIWrapper& wmi, const WmiTable& table, Json::Value& rows) {
  WMIWrapper::Table instances;
  const int result = wmi.ExecuteQuery(table.query, PropertiesOf(table), instances);
  for (const std::vector<Json::Value>& values : instances) {
    // Values carry no names, so of a shorter row nobody knows which ones it has.
    if (values.size() == table.columns.size()) {
      rows.append(MakeObject(table, [&](size_t i) { return values[i]; }));
      continue;
    }
    LOG_ERROR(table.function, L"propertyNames.size() != propertyValues.size()");
    if (table.hole == Hole::kDropsTable) {
      rows = Json::Value();
      break;
    }
  }
  return result == 0;
}

}  // namespace

bool ReadWmiTable(WMIWrapper& wmi, const WmiTable& table, Json::Value& rows) {
  rows = Json::Value(Json::arrayValue);
  return table.hole == Hole::kIsNull ? ReadWithNulls(wmi, table, rows) : ReadWholeRows(wmi, table, rows);
}

}  // namespace systeminfo
