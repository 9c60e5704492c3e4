#include <map>
#include <string>
#include <unordered_map>
#include <vector>

#include "report/facts.h"
#include "report/tables/records.h"
#include "report/tables/table_functions.h"

namespace report {
namespace {

constexpr char kFile[] = "running_tasks.json";

// No member: the rows' place in the tree is worked out.
constexpr char kParentRow[] = "parentRow";

constexpr MemberColumn kProcess[] = {{"Name", "name", "Name"},
                                     {"ProcessId", "pid", "Process id", Form::kNumber},
                                     {"ParentProcessId", "parentPid", "Parent's id", Form::kNumber},
                                     {"User", "account", "Account"},
                                     {"signed", "signed", "Signed", Form::kFlag},
                                     {"ExecutablePath", "path", "Path"},
                                     {"CommandLine", "commandLine", "Command line"},
                                     {"Description", "description", "Description"},
                                     {"Priority", "priority", "Priority", Form::kNumber},
                                     {"imageType", "imageType", "Image type"},
                                     {"md5", "md5", "MD5"},
                                     {"modules", "modules", "Modules", Form::kElementCount},
                                     {"handles", "handles", "Handles", Form::kElementCount}};

const Json::Value& Processes(const Collection& collection) {
  return Member(collection.Document("running_tasks"), "processes");
}

constexpr size_t kNone = static_cast<size_t>(-1);

// The row of each row's parent. Identifiers are used again and packages may lie: an own parent or a circle is none.
std::vector<size_t> ParentsOf(const Table& table) {
  const size_t id = table.ColumnIndex("pid");
  const size_t parentId = table.ColumnIndex("parentPid");
  std::unordered_map<double, size_t> rowOfId;
  for (size_t row = 0; row < table.rows.size(); ++row) {
    if (table.rows[row][id].isNumeric()) rowOfId.emplace(table.rows[row][id].asDouble(), row);
  }
  std::vector<size_t> parents(table.rows.size(), kNone);
  for (size_t row = 0; row < parents.size(); ++row) {
    if (!table.rows[row][parentId].isNumeric()) continue;
    const auto found = rowOfId.find(table.rows[row][parentId].asDouble());
    if (found != rowOfId.end()) parents[row] = found->second;
  }
  return parents;
}

// Makes the first row of each circle that is come across a root.
void CutCircles(std::vector<size_t>& parents) {
  std::vector<size_t> seenFrom(parents.size(), kNone);
  for (size_t start = 0; start < parents.size(); ++start) {
    size_t row = start;
    while (seenFrom[row] == kNone) {
      seenFrom[row] = start;
      const size_t parent = parents[row];
      if (parent == kNone) break;
      if (seenFrom[parent] == start) {
        parents[row] = kNone;
        break;
      }
      row = parent;
    }
  }
}

// As it stands in each row of a process.
Cell ProcessName(const Json::Value& process) {
  return Shortened(TextOf(Member(process, "Name")), kLongestRowPath);
}

}  // namespace

void AddProcessTable(TableContext& context) {
  const Json::Value& processes = Processes(context.collection);
  if (!processes.isArray()) return;
  context.Take("running_tasks", "processes");
  Table table = context.MakeTable("processes");
  AddRecords(table, kFile, "processes", processes, kProcess, 0);
  std::vector<size_t> parents = ParentsOf(table);
  CutCircles(parents);
  table.parentColumn = kParentRow;
  table.columns.push_back({kParentRow, "Parent's row", ColumnType::kNumber});
  for (size_t row = 0; row < parents.size(); ++row)
    table.rows[row].push_back(parents[row] == kNone ? Cell() : Cell(Json::UInt64{parents[row]}));
  context.Add(std::move(table));
}

void AddModuleTable(TableContext& context) {
  Table table = context.MakeTable(
      "modules", {{"path", "Path"}, {"process", "Process"}, {"pid", "Process id", ColumnType::kNumber}});
  ForEachProcess(context.collection, [&](const Json::Value& process, const std::string&) {
    ForEachElement(Member(process, "modules"), [&](const Json::Value& module, const std::string&) {
      const Json::Value& name = Member(module, "name");
      AddRow(table, {TextCell(name.isString() ? name : module), ProcessName(process),
                     CellOf(Member(process, "ProcessId"), Form::kNumber, 0)});
    });
  });
  if (!table.rows.empty()) context.Add(std::move(table));
}

void AddHandleTable(TableContext& context) {
  Table table = context.MakeTable("handles", {{"type", "Type"},
                                              {"count", "Handles", ColumnType::kNumber},
                                              {"process", "Process"},
                                              {"pid", "Process id", ColumnType::kNumber}});
  ForEachProcess(context.collection, [&](const Json::Value& process, const std::string&) {
    std::map<std::string, size_t> counts;
    ForEachElement(Member(process, "handles"), [&](const Json::Value& handle, const std::string&) {
      const Json::Value& type = Member(handle, "type");
      ++counts[Shortened(TextOf(TextCell(type.isNull() ? handle : type)), kLongestRowPath)];
    });
    for (const auto& [type, count] : counts) {
      AddRow(table,
             {type, Json::UInt64{count}, ProcessName(process), CellOf(Member(process, "ProcessId"), Form::kNumber, 0)});
    }
  });
  if (!table.rows.empty()) context.Add(std::move(table));
}

}  // namespace report
