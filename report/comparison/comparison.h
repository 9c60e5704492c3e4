// What changed between two collections of one machine. Rows are paired by what names them, not by where they stand, and
// only facts that last are looked at: report/comparison/comparison.cpp has the table. Pure functions.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "report/collection.h"
#include "report/overview.h"
#include "report/tables/table.h"

namespace report {

inline constexpr size_t kMostChanges = 20'000;  // that are kept; the others are counted
inline constexpr size_t kLongestChangeText = 2 << 10;

enum class ChangeKind { kAdded, kRemoved, kChanged };

struct Change {
  ChangeKind kind = ChangeKind::kChanged;
  std::string table;   // its title
  std::string item;    // what names it
  std::string field;   // empty for what was added or removed
  std::string before;  // in the older collection
  std::string after;
};

struct Comparison {
  bool isOtherOlder = true;           // by the times of the collections; without them the other one counts as the older
  std::string otherTime;              // as the manifest has it; empty when it is not known
  std::vector<std::string> warnings;  // above all, that the machines are not the same
  std::vector<Change> changes;
  size_t count = 0;                       // with those that are not kept
  std::vector<LabelledText> notCompared;  // table, why: it is in one collection only
};

// One of the two: its documents and the tables that were made of them.
struct ComparedSide {
  const Collection& collection;
  const std::vector<Table>& tables;
};

Comparison Compare(const ComparedSide& side, const ComparedSide& other);

const char* ChangeKindName(ChangeKind kind);  // "added", "removed", "changed"

// The changes as a table of the report.
Table ChangesTable(const Comparison& comparison);

}  // namespace report
