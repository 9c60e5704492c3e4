// Tables of records: one row for each element of an array. Which members have which title and form is told by a list;
// members that no list knows get columns of their own, so that nothing of a record is lost. Pure functions.
#pragma once

#include <span>
#include <string>
#include <string_view>

#include "report/tables/table.h"

namespace report {

// How a member's value is written in the document, and so what its column holds.
enum class Form {
  kText,
  kNumber,
  kBytes,
  kFlag,          // true, false, or WMI's -1 and 0
  kEventTime,     // "3/4/2024 09:05:07", local time
  kUtcSeconds,    // since 1970
  kFileTime,      // 100 ns since 1601, UTC
  kDay,           // "20240304"
  kEventType,     // the event log's type as a decimal text
  kElementCount,  // how many elements an array has; its elements are shown elsewhere
};

struct MemberColumn {
  std::string_view member;
  const char* id;
  const char* title;
  Form form = Form::kText;
};

// Adds the members' columns to an empty table.
void AddColumns(Table& table, std::span<const MemberColumn> members);

// Adds a row for each element; one that is no object stands in the first column. `offset` is added to UTC times.
void AddRecords(Table& table, const std::string& file, const std::string& path, const Json::Value& array,
                std::span<const MemberColumn> members, double utcOffset);

Cell CellOf(const Json::Value& value, Form form, double utcOffset);

}  // namespace report
