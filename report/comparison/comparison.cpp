#include "report/comparison/comparison.h"

#include <algorithm>
#include <map>
#include <span>
#include <string_view>

#include "report/comparison/change_list.h"
#include "report/json_access.h"
#include "report/windows_text.h"

namespace report {
namespace {

struct ComparedTable {
  std::string_view id;
  std::vector<std::string_view> keys;    // columns that together name a row, whatever the case of their letters
  std::vector<std::string_view> fields;  // columns that are compared; none of them is a time, an id or a counter
};

// What is compared, and by what. The registry is compared by paths.
const ComparedTable kCompared[] = {
    {"software", {"name"}, {"version", "publisher"}},
    {"updates", {"name", "program"}, {}},
    {"services", {"name"}, {"displayName", "state", "startMode", "account", "path", "serviceType"}},
    {"drivers", {"name"}, {"description", "state", "startMode", "path", "serviceType"}},
    {"startup", {"key", "name"}, {"value"}},
    {"files", {"path"}, {"version", "md5"}},
    {"processes", {"path", "name"}, {"signed", "md5"}},  // the programs that ran, not how often
    {"partitions", {"drive"}, {"fileSystem", "size", "volume", "serial"}},
    {"disks", {"model"}, {"partitions", "sector"}},
    {"network", {"localName", "remoteName"}, {"remotePath", "resourceType", "user"}},
    {"doc-system_summary", {"place"}, {"value"}},
};

// Facts of the system summary that are another one in every collection.
constexpr std::string_view kVolatile[] = {"Available Physical Memory", "Available Virtual Memory"};

// Facts that stay as long as a machine does.
constexpr const char* kIdentity[] = {"System Name",   "System Manufacturer",    "System Model",
                                     "System Type",   "BaseBoard Manufacturer", "BaseBoard Model",
                                     "BaseBoard Name"};

std::string CellText(const Cell& cell) {
  return cell.isNull() ? std::string() : TextOf(TextCell(cell));
}

const Table* TableNamed(const std::vector<Table>& tables, std::string_view id) {
  for (const Table& table : tables) {
    if (table.id == id) return &table;
  }
  return nullptr;
}

using Fields = std::vector<std::string>;

std::string Joined(const Fields& fields) {
  std::string joined;
  for (const std::string& field : fields) {
    if (!field.empty()) joined += (joined.empty() ? "" : ", ") + field;
  }
  return joined;
}

struct Item {
  std::string name;            // as it is shown
  std::vector<Fields> states;  // one for each row of the name, sorted, no two the same
};

// The rows by what names them.
std::map<std::string, Item> ItemsOf(const Table& table, const ComparedTable& compared) {
  const auto cellsOf = [&table](const Row& row, const std::vector<std::string_view>& columns) {
    Fields cells;
    for (const std::string_view column : columns) {
      const size_t index = table.ColumnIndex(column);
      cells.push_back(index < row.size() ? CellText(row[index]) : std::string());
    }
    return cells;
  };
  std::map<std::string, Item> items;
  for (const Row& row : table.rows) {
    std::string key;
    std::string name;
    for (const std::string& cell : cellsOf(row, compared.keys)) {
      key += LowerAscii(cell) + '\n';
      if (!cell.empty()) name += (name.empty() ? "" : ", ") + cell;
    }
    Fields fields = cellsOf(row, compared.fields);
    if (name.empty()) {  // a file of a startup folder: what it is names it
      name = Joined(fields);
      key = LowerAscii(name);
      fields.assign(fields.size(), "");
    }
    Item& item = items[key];
    item.name = name;
    item.states.push_back(std::move(fields));
  }
  for (auto& [key, item] : items) {
    std::sort(item.states.begin(), item.states.end());
    item.states.erase(std::unique(item.states.begin(), item.states.end()), item.states.end());
  }
  return items;
}

std::vector<Fields> Without(const std::vector<Fields>& states, const std::vector<Fields>& others) {
  std::vector<Fields> rest;
  std::set_difference(states.begin(), states.end(), others.begin(), others.end(), std::back_inserter(rest));
  return rest;
}

// Compares what is left of two tables once they are keyed.
class TablePair {
 public:
  TablePair(const ComparedTable& compared, const Table& older, const Table& newer, ChangeList& changes)
      : m_compared(compared), m_older(older), m_newer(newer), m_changes(changes) {}

  void Compare() {
    const auto before = ItemsOf(m_older, m_compared);
    const auto after = ItemsOf(m_newer, m_compared);
    for (const auto& [key, item] : before) {
      const auto found = after.find(key);
      if (IsVolatile(item.name)) continue;
      CompareStates(item.name, item.states, found == after.end() ? std::vector<Fields>() : found->second.states);
    }
    for (const auto& [key, item] : after) {
      if (!before.contains(key) && !IsVolatile(item.name)) CompareStates(item.name, {}, item.states);
    }
  }

 private:
  bool IsVolatile(std::string_view name) const {
    return m_compared.id == "doc-system_summary" &&
           std::find(std::begin(kVolatile), std::end(kVolatile), name) != std::end(kVolatile);
  }

  void CompareStates(const std::string& name, const std::vector<Fields>& before, const std::vector<Fields>& after) {
    const std::vector<Fields> gone = Without(before, after);
    const std::vector<Fields> come = Without(after, before);
    if (gone.size() == 1 && come.size() == 1) return AddChanged(name, gone[0], come[0]);
    for (const Fields& fields : gone)
      m_changes.Add({ChangeKind::kRemoved, m_newer.title, name, "", Joined(fields), ""});
    for (const Fields& fields : come)
      m_changes.Add({ChangeKind::kAdded, m_newer.title, name, "", "", Joined(fields)});
  }

  void AddChanged(const std::string& name, const Fields& before, const Fields& after) {
    for (size_t i = 0; i < before.size(); ++i) {
      if (before[i] == after[i]) continue;
      const std::string& field = m_newer.columns[m_newer.ColumnIndex(m_compared.fields[i])].title;
      m_changes.Add({ChangeKind::kChanged, m_newer.title, name, field, before[i], after[i]});
    }
  }

  const ComparedTable& m_compared;
  const Table& m_older;
  const Table& m_newer;
  ChangeList& m_changes;
};

void CompareTables(const ComparedSide& older, const ComparedSide& newer, Comparison& comparison) {
  constexpr std::string_view kRegistry = "registry";
  ChangeList changes(comparison);
  const auto compare = [&](std::string_view id, const auto& function) {
    const Table* const before = TableNamed(older.tables, id);
    const Table* const after = TableNamed(newer.tables, id);
    if (before != nullptr && after != nullptr) return function(*before, *after);
    if (before == nullptr && after == nullptr) return;
    comparison.notCompared.push_back(
        {(before != nullptr ? before : after)->title,
         before != nullptr ? "not in the newer collection" : "not in the older collection"});
  };
  for (const ComparedTable& compared : kCompared) {
    compare(compared.id,
            [&](const Table& before, const Table& after) { TablePair(compared, before, after, changes).Compare(); });
  }
  compare(kRegistry, [&](const Table&, const Table& after) {
    CompareRegistries(older.collection.Document(kRegistry), newer.collection.Document(kRegistry), after.title, changes);
  });
}

void CheckMachine(const Collection& older, const Collection& newer, Comparison& comparison) {
  std::string differing;
  bool isKnown = false;
  for (const char* name : kIdentity) {
    const std::string before = CellText(Member(older.Document("system_summary"), name));
    const std::string after = CellText(Member(newer.Document("system_summary"), name));
    if (before.empty() || after.empty()) continue;
    isKnown = true;
    if (LowerAscii(before) == LowerAscii(after)) continue;
    differing += (differing.empty() ? "" : "; ") + std::string(name) + ": " + Shortened(before, kLongestRowPath) +
                 " and " + Shortened(after, kLongestRowPath);
  }
  if (!isKnown) {
    comparison.warnings.push_back(
        "Whether the collections are of one machine cannot be told: system_summary.json is missing.");
  } else if (!differing.empty()) {
    comparison.warnings.push_back("The collections are of different machines (" + differing +
                                  "): what is listed as changed is how they differ.");
  }
}

}  // namespace

Comparison Compare(const ComparedSide& side, const ComparedSide& other) {
  Comparison comparison;
  const auto& time = side.collection.collectedAt;
  const auto& otherTime = other.collection.collectedAt;
  comparison.isOtherOlder = !time || !otherTime || *otherTime <= *time;
  if (otherTime) comparison.otherTime = TextOf(Member(other.collection.Document(kManifestName), "start"));
  if (!time || !otherTime) {
    comparison.warnings.push_back(
        "One of the collections has no time; the one that was named last counts as the older.");
  }
  const ComparedSide& older = comparison.isOtherOlder ? other : side;
  const ComparedSide& newer = comparison.isOtherOlder ? side : other;
  CheckMachine(older.collection, newer.collection, comparison);
  CompareTables(older, newer, comparison);
  return comparison;
}

const char* ChangeKindName(ChangeKind kind) {
  switch (kind) {
    case ChangeKind::kAdded:
      return "added";
    case ChangeKind::kRemoved:
      return "removed";
    case ChangeKind::kChanged:
      return "changed";
  }
  return "";
}

Table ChangesTable(const Comparison& comparison) {
  Table table{"changes", "Changes"};
  for (const auto& [id, title] :
       {std::pair("kind", "Change"), std::pair("table", "Of"), std::pair("item", "What"), std::pair("field", "Fact"),
        std::pair("before", "Before"), std::pair("after", "After")})
    table.columns.push_back({id, title});
  for (const Change& change : comparison.changes) {
    Row row = {ChangeKindName(change.kind)};
    for (const std::string* text : {&change.table, &change.item, &change.field, &change.before, &change.after})
      row.push_back(*text);
    AddRow(table, std::move(row));
  }
  table.omitted += comparison.count - comparison.changes.size();
  return table;
}

}  // namespace report
