#include "report/tables/table.h"

#include <algorithm>
#include <cmath>

#include "core/json.h"
#include "report/times.h"

namespace report {

size_t Table::ColumnIndex(std::string_view columnId) const {
  size_t index = 0;
  while (index < columns.size() && columns[index].id != columnId)
    ++index;
  return index;
}

Table TableContext::MakeTable(std::string id, std::vector<Column> columns) const {
  Table table{std::move(id), "", std::move(columns)};
  table.mostRows = std::min(kMostRows, kMostRowsTogether - std::min(rows, kMostRowsTogether));
  return table;
}

void TableContext::Add(Table table) {
  rows += table.rows.size();
  tables.push_back(std::move(table));
}

Cell TextCell(const Json::Value& value) {
  const char* begin = nullptr;
  const char* end = nullptr;
  if (value.isNull()) return {};
  if (value.isString() && value.getString(&begin, &end)) {
    const std::string_view text(begin, static_cast<size_t>(end - begin));
    return text.size() <= kLongestCell ? value : Cell(Shortened(text, kLongestCell));
  }
  std::string text;
  WriteCompactJson(value.isDouble() ? NumberCell(value.asDouble()) : value, [&](std::string_view piece) {
    text += piece.substr(0, kLongestCell + 1);
    return text.size() <= kLongestCell;
  });
  if (text.ends_with('\n')) text.pop_back();
  return Shortened(text, kLongestCell);
}

Cell NumberCell(double number) {
  constexpr double kWholeUpTo = 9'007'199'254'740'992;  // 2^53
  const bool isWhole = std::abs(number) <= kWholeUpTo && number == std::floor(number);
  return isWhole ? Cell(Json::Int64{static_cast<Json::Int64>(number)}) : Cell(number);
}

Cell TimeCell(double seconds) {
  constexpr double kYear1601 = -11'644'473'600;
  constexpr double kYear10000 = 253'402'300'800;
  if (!(seconds >= kYear1601 && seconds < kYear10000)) return {};
  return Json::Int64{static_cast<Json::Int64>(std::floor(seconds * 1000))};
}

bool AddRow(Table& table, Row row) {
  if (table.rows.size() >= table.mostRows) {
    ++table.omitted;
    return false;
  }
  table.rows.push_back(std::move(row));
  return true;
}

}  // namespace report
