// The report's data: one JSON document that the page shows. docs/report.md says what is in it. Pure functions.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "report/collection.h"
#include "report/comparison/comparison.h"
#include "report/finding.h"
#include "report/tables/table.h"

namespace report {

inline constexpr int kDataVersion = 1;
inline constexpr size_t kLargestData = size_t{128} << 20;  // bytes; rows beyond it are counted as omitted

// What was opened, by the name that the user gave.
struct ReportSource {
  std::string name;
  uint64_t bytes = 0;  // 0: a folder
};

// What the collection was compared with.
struct ComparedWith {
  const Comparison& comparison;
  ReportSource other;
};

// ASCII only. Takes the tables, as those of a large package are not to be held twice. `compared` may be null; else the
// changes are the first table.
std::string DataDocument(const Collection& collection, const ReportSource& source, const std::vector<Finding>& findings,
                         std::vector<Table> tables, const ComparedWith* compared = nullptr);

}  // namespace report
