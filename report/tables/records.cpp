#include "report/tables/records.h"

#include <optional>

#include "report/json_access.h"
#include "report/times.h"

namespace report {
namespace {

ColumnType TypeOf(Form form) {
  switch (form) {
    case Form::kNumber:
    case Form::kElementCount:
      return ColumnType::kNumber;
    case Form::kBytes:
      return ColumnType::kBytes;
    case Form::kFlag:
      return ColumnType::kFlag;
    case Form::kEventTime:
    case Form::kUtcSeconds:
    case Form::kFileTime:
    case Form::kDay:
      return ColumnType::kTime;
    case Form::kText:
    case Form::kEventType:
      break;
  }
  return ColumnType::kText;
}

std::optional<double> SecondsOf(const Json::Value& value, Form form, double utcOffset) {
  if (form == Form::kEventTime) return TimeFromEvent(TextOf(value));
  if (form == Form::kDay) return TimeFromDay(TextOf(value));
  const auto number = NumberOf(value);
  if (!number || *number <= 0) return std::nullopt;  // 0: never
  return (form == Form::kFileTime ? SecondsFromFileTime(*number) : *number) + utcOffset;
}

Cell EventTypeCell(const Json::Value& value) {
  constexpr struct {
    std::string_view type;
    const char* name;
  } kTypes[] = {{"1", "error"},       {"2", "warning"},       {"4", "information"},
                {"0", "information"}, {"8", "audit success"}, {"16", "audit failure"}};
  for (const auto& type : kTypes) {
    if (TextOf(value) == type.type) return type.name;
  }
  return TextCell(value);
}

Cell FlagCell(const Json::Value& value) {
  if (value.isBool()) return value;
  const auto number = NumberOf(value);
  return number ? Cell(*number != 0) : TextCell(value);
}

std::string_view NameOf(const Json::ValueConstIterator& member) {
  const char* end = nullptr;
  const char* begin = member.memberName(&end);
  return {begin, static_cast<size_t>(end - begin)};
}

// Makes rows of records; a member that is new gets a column, as long as there is room.
class RowMaker {
 public:
  RowMaker(Table& table, std::span<const MemberColumn> members, double utcOffset)
      : m_table(table), m_members(members), m_utcOffset(utcOffset) {}

  Row RowOf(const Json::Value& record) {
    if (m_table.columns.empty() && !record.isObject()) m_table.columns.push_back({"value", "Value"});
    Row row(m_table.columns.size());
    if (!record.isObject()) {
      row[0] = TextCell(record);
      return row;
    }
    for (auto member = record.begin(); member != record.end(); ++member) {
      const size_t column = ColumnOf(NameOf(member));
      if (column == kMostColumns) continue;
      row.resize(m_table.columns.size());
      row[column] = CellOf(*member, column < m_members.size() ? m_members[column].form : Form::kText, m_utcOffset);
    }
    return row;
  }

 private:
  size_t ColumnOf(std::string_view name) {
    for (size_t i = 0; i < m_members.size(); ++i) {
      if (m_members[i].member == name) return i;
    }
    const std::string_view title = name.substr(0, kLongestRowPath);
    for (size_t i = m_members.size(); i < m_table.columns.size(); ++i) {
      if (m_table.columns[i].title == title) return i;
    }
    if (m_table.columns.size() >= kMostColumns) return kMostColumns;
    m_table.columns.push_back({"member" + std::to_string(m_table.columns.size()), std::string(title)});
    return m_table.columns.size() - 1;
  }

  Table& m_table;
  const std::span<const MemberColumn> m_members;
  const double m_utcOffset;
};

}  // namespace

void AddColumns(Table& table, std::span<const MemberColumn> members) {
  for (const MemberColumn& member : members)
    table.columns.push_back({member.id, member.title, TypeOf(member.form)});
}

Cell CellOf(const Json::Value& value, Form form, double utcOffset) {
  if (value.isNull()) return {};
  if (form == Form::kElementCount && value.isArray()) return Json::UInt64{value.size()};
  if (form == Form::kFlag) return FlagCell(value);
  if (form == Form::kEventType) return EventTypeCell(value);
  const ColumnType type = TypeOf(form);
  if (type == ColumnType::kTime) {
    const auto seconds = SecondsOf(value, form, utcOffset);
    const Cell time = seconds ? TimeCell(*seconds) : Cell();
    return time.isNull() ? TextCell(value) : time;
  }
  const auto number = type == ColumnType::kText ? std::nullopt : NumberOf(value);
  return number ? NumberCell(*number) : TextCell(value);
}

void AddRecords(Table& table, const std::string& file, const std::string& path, const Json::Value& array,
                std::span<const MemberColumn> members, double utcOffset) {
  if (!array.isArray()) return;
  if (table.columns.empty()) AddColumns(table, members);
  const size_t firstRow = table.rows.size();
  RowMaker maker(table, members, utcOffset);
  for (const Json::Value& record : array)
    AddRow(table, maker.RowOf(record));
  for (Row& row : table.rows)
    row.resize(table.columns.size());
  table.sources.push_back({file, path, firstRow, table.rows.size() - firstRow});
}

}  // namespace report
