// What the report shows of a collection, as tables: plain data between the documents of a package and the page. A table
// keeps the order of what it was made of, so that the place of a finding's evidence leads to a row. UTF-8.
#pragma once

#include <json/value.h>

#include <cstddef>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "report/collection.h"
#include "report/json_access.h"

namespace report {

// What a hostile package can make of a report is bounded; the program's own packages stay far below.
inline constexpr size_t kMostRows = 200'000;          // of one table
inline constexpr size_t kMostRowsTogether = 500'000;  // of all tables; the first ones come first
inline constexpr size_t kMostColumns = 40;            // of one table
inline constexpr size_t kMostTables = 200;            // of one report
inline constexpr size_t kLongestCell = 16 << 10;      // bytes of text
inline constexpr size_t kLongestRowPath = 512;        // bytes of a place within a document, and of what rows repeat

enum class ColumnType { kText, kNumber, kBytes, kTime, kFlag };

struct Column {
  std::string id;
  std::string title;
  ColumnType type = ColumnType::kText;
};

// Null, text, a number or a truth value. What is not of its column's type is text. A time is in milliseconds since
// 1970-01-01 by the wall clock of the customer's machine.
using Cell = Json::Value;
using Row = std::vector<Cell>;  // as many cells as there are columns

// The rows that stand for the elements of one array of one document.
struct RowSource {
  std::string file;  // "services.json"
  std::string path;  // of the array within it; empty for the document itself
  size_t firstRow = 0;
  size_t count = 0;
};

struct Table {
  std::string id;
  std::string title;
  std::vector<Column> columns = {};
  std::vector<Row> rows = {};
  std::string parentColumn = {};  // of a tree: the column with the index of the parent's row, or null
  size_t mostRows = kMostRows;
  size_t omitted = 0;  // rows beyond the limits
  std::vector<RowSource> sources = {};
  // The file of which each row is a place, named by the first column; else empty. `below` stands before all of them.
  std::string flattened = {};
  std::string below = {};

  // The column's index; the number of columns when there is none.
  size_t ColumnIndex(std::string_view columnId) const;
};

// What the functions that make tables share: they take what they show, so that the rest can be shown as it is.
struct TableContext {
  const Collection& collection;
  std::vector<Table> tables = {};
  size_t rows = 0;                                           // of the tables
  std::set<std::pair<std::string, std::string>> taken = {};  // document, and member of it or "" for all of it

  void Take(const std::string& document, const std::string& member) { taken.emplace(document, member); }

  // An empty table for as many rows as there is still room for; its title is that of the list.
  Table MakeTable(std::string id, std::vector<Column> columns = {}) const;
  void Add(Table table);
};

// A value of any kind as the text of a cell; null stays null.
Cell TextCell(const Json::Value& value);

Cell NumberCell(double number);  // a whole one without a point

Cell TimeCell(double seconds);  // null for what is no moment of the years 1601 to 9999

// False, counted as omitted, when the table is full.
bool AddRow(Table& table, Row row);

}  // namespace report
