#include <string>

#include "report/json_access.h"
#include "report/tables/records.h"
#include "report/tables/table_functions.h"

namespace report {
namespace {

constexpr char kDocument[] = "windows_events";

constexpr MemberColumn kEvent[] = {{"TimeGenerated", "time", "Time", Form::kEventTime},
                                   {"EventType", "type", "Type", Form::kEventType},
                                   {"", "log", "Log"},  // set below: no member has it
                                   {"SourceName", "source", "Source"},
                                   {"message", "message", "Message"},
                                   {"InsertionStrings", "texts", "Inserted texts"},
                                   {"Computername", "computer", "Computer"}};

}  // namespace

// The inserted texts are the only ones that a message without a library has; as an array's text they stay apart.
void AddEventTable(TableContext& context) {
  Table table = context.MakeTable("events");
  ForEachMember(context.collection.Document(kDocument), [&](const std::string& log, const Json::Value& events) {
    if (!events.isArray()) return;
    context.Take(kDocument, log);
    const size_t first = table.rows.size();
    AddRecords(table, std::string(kDocument) + ".json", log, events, kEvent, 0);
    const size_t column = table.ColumnIndex("log");
    for (size_t row = first; row < table.rows.size(); ++row)
      table.rows[row][column] = Shortened(log, kLongestRowPath);
  });
  if (!table.sources.empty()) context.Add(std::move(table));
}

}  // namespace report
