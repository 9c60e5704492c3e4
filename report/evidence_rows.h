// From a finding's evidence to the row of a table that shows it.
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "report/finding.h"
#include "report/tables/table.h"

namespace report {

struct EvidenceRow {
  const Table* table = nullptr;  // null: no table shows it
  std::optional<size_t> row;     // none: it is about the table as a whole, or the row was beyond a limit
};

// The tables must outlive it.
class EvidenceRows {
 public:
  explicit EvidenceRows(const std::vector<Table>& tables) : m_tables(tables) {}

  EvidenceRow Find(const Evidence& evidence);

 private:
  EvidenceRow FindElement(const Evidence& evidence) const;
  EvidenceRow FindPlace(const Evidence& evidence);
  EvidenceRow FindFile(const Evidence& evidence) const;

  using Places = std::unordered_map<std::string, size_t>;
  const std::vector<Table>& m_tables;
  std::unordered_map<const Table*, Places> m_places;  // of the tables that were asked for
};

}  // namespace report
