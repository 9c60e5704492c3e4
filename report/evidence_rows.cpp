#include "report/evidence_rows.h"

#include <charconv>

#include "report/json_access.h"

namespace report {
namespace {

// The index of "[12].Name"; nothing for other texts.
std::optional<size_t> LeadingIndex(std::string_view path) {
  if (!path.starts_with('[')) return std::nullopt;
  path.remove_prefix(1);
  size_t index = 0;
  const auto [stop, error] = std::from_chars(path.data(), path.data() + path.size(), index);
  const bool isClosed = stop != path.data() + path.size() && *stop == ']';
  return error == std::errc() && isClosed ? std::optional(index) : std::nullopt;
}

}  // namespace

EvidenceRow EvidenceRows::Find(const Evidence& evidence) {
  const EvidenceRow element = FindElement(evidence);
  if (element.row) return element;
  const EvidenceRow place = FindPlace(evidence);
  if (place.row) return place;
  const EvidenceRow file = FindFile(evidence);
  if (file.row) return file;
  return element.table != nullptr ? element : place;
}

EvidenceRow EvidenceRows::FindElement(const Evidence& evidence) const {
  EvidenceRow found;
  for (const Table& table : m_tables) {
    for (const RowSource& source : table.sources) {
      if (source.file != evidence.file || !evidence.path.starts_with(source.path)) continue;
      const auto index = LeadingIndex(std::string_view(evidence.path).substr(source.path.size()));
      if (index && *index < source.count) return {&table, source.firstRow + *index};
      const bool isWhole = !evidence.path.empty() && evidence.path == source.path;
      if (index || isWhole) found.table = &table;
    }
  }
  return found;
}

// The place itself, else what it lies in.
EvidenceRow EvidenceRows::FindPlace(const Evidence& evidence) {
  EvidenceRow found;
  for (const Table& table : m_tables) {
    if (table.flattened.empty() || table.flattened != evidence.file) continue;
    auto [places, isNew] = m_places.try_emplace(&table);
    for (size_t row = 0; isNew && row < table.rows.size(); ++row)
      places->second.emplace(table.below + TextOf(table.rows[row][0]), row);
    std::string place = evidence.path;
    while (!place.empty()) {
      const auto row = places->second.find(place);
      if (row != places->second.end()) return {&table, row->second};
      const size_t end = place.find_last_of(".[");
      place.resize(end == std::string::npos ? 0 : end);
    }
    if (table.below.empty()) found.table = &table;
  }
  return found;
}

EvidenceRow EvidenceRows::FindFile(const Evidence& evidence) const {
  for (const Table& table : m_tables) {
    if (table.id != "package" || !evidence.path.empty()) continue;
    for (size_t row = 0; row < table.rows.size(); ++row) {
      const std::string name = TextOf(table.rows[row][0]);
      if (name == evidence.file || name.ends_with("/" + evidence.file)) return {&table, row};
    }
  }
  return {};
}

}  // namespace report
