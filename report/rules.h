// The rules by which a collection is judged: one table, in the order in which findings are shown within a severity.
#pragma once

#include <span>
#include <string_view>
#include <vector>

#include "report/collection.h"
#include "report/finding.h"

namespace report {

struct Rule {
  const char* id;  // for scripts; never changes
  Severity severity;
  const char* title;
  const char* explanation;  // what it means and what to do
  void (*find)(const Collection& collection, EvidenceList& found);
};

std::span<const Rule> RuleTable();

// The rules that found something, the gravest first.
std::vector<Finding> FindAll(const Collection& collection);

const char* SeverityName(Severity severity);  // "error", "warning", "info"

}  // namespace report
