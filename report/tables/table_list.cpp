#include "report/tables/table_list.h"

#include <span>
#include <variant>

#include "report/json_access.h"
#include "report/tables/records.h"
#include "report/tables/table_functions.h"

namespace report {
namespace {

constexpr MemberColumn kStartup[] = {
    {"value", "value", "Program"}, {"name", "name", "Name"}, {"key", "key", "Registry key"}};

constexpr MemberColumn kSoftware[] = {{"Name", "name", "Name"},
                                      {"Version", "version", "Version"},
                                      {"Publisher", "publisher", "Publisher"},
                                      {"InstallDate", "installed", "Installed", Form::kDay}};

constexpr MemberColumn kUpdates[] = {
    {"Name", "name", "Name"}, {"Program", "program", "Program"}, {"InstallDate", "installed", "Installed", Form::kDay}};

constexpr MemberColumn kServices[] = {{"Name", "name", "Name"},
                                      {"DisplayName", "displayName", "Display name"},
                                      {"State", "state", "State"},
                                      {"StartMode", "startMode", "Start"},
                                      {"StartName", "account", "Account"},
                                      {"PathName", "path", "Path"},
                                      {"ServiceType", "serviceType", "Type"}};

constexpr MemberColumn kDrivers[] = {{"Name", "name", "Name"},
                                     {"Description", "description", "Description"},
                                     {"State", "state", "State"},
                                     {"StartMode", "startMode", "Start"},
                                     {"PathName", "path", "Path"},
                                     {"ServiceType", "serviceType", "Type"},
                                     {"Started", "started", "Started", Form::kFlag},
                                     {"AcceptPause", "acceptPause", "Accepts pause", Form::kFlag},
                                     {"AcceptStop", "acceptStop", "Accepts stop", Form::kFlag}};

constexpr MemberColumn kNetwork[] = {{"LocalName", "localName", "Local name"},
                                     {"RemoteName", "remoteName", "Remote name"},
                                     {"RemotePath", "remotePath", "Remote path"},
                                     {"ResourceType", "resourceType", "Type"},
                                     {"Status", "status", "Status"},
                                     {"UserName", "user", "User"}};

constexpr MemberColumn kFiles[] = {{"path", "path", "Path"}, {"version", "version", "Version"}, {"md5", "md5", "MD5"}};

constexpr MemberColumn kScanCache[] = {{"path", "path", "Path"},
                                       {"latime", "latime", "Last access", Form::kFileTime},
                                       {"lstime", "lstime", "Last scan", Form::kFileTime}};

constexpr MemberColumn kPartitions[] = {{"Drive Letter", "drive", "Drive"},
                                        {"File System", "fileSystem", "File system"},
                                        {"Size", "size", "Size", Form::kBytes},
                                        {"Free Space", "free", "Free", Form::kBytes},
                                        {"VolumeName", "volume", "Volume"},
                                        {"VolumeSerialNumber", "serial", "Serial number"},
                                        {"Description", "description", "Description"},
                                        {"Compressed", "compressed", "Compressed", Form::kFlag}};

constexpr MemberColumn kDisks[] = {{"Model", "model", "Model"},
                                   {"Partitions", "partitions", "Partitions", Form::kNumber},
                                   {"BytesPerSector", "sector", "Bytes per sector", Form::kNumber}};

constexpr MemberColumn kCollectors[] = {{"name", "name", "Name"},
                                        {"outcome", "outcome", "Outcome"},
                                        {"reason", "reason", "Reason"},
                                        {"records", "records", "Records", Form::kNumber},
                                        {"bytes", "bytes", "Size", Form::kBytes},
                                        {"milliseconds", "milliseconds", "Milliseconds", Form::kNumber},
                                        {"errors", "errors", "Errors"},
                                        {"class", "class", "Class"}};

// One row for each element of an array.
struct RecordTable {
  const char* document;
  const char* member;  // that holds the array; empty for the document itself
  std::span<const MemberColumn> columns;
};

using TableFunction = void (*)(TableContext& context);

struct TableEntry {
  const char* id;
  const char* title;
  std::variant<RecordTable, TableFunction> source;
};

// The only list. Ids never change.
const TableEntry kTables[] = {
    {"processes", "Processes", &AddProcessTable},
    {"events", "Event log", &AddEventTable},
    {"startup", "Startup programs", RecordTable{"startup_programs", "", kStartup}},
    {"software", "Installed software", RecordTable{"installed_software", "", kSoftware}},
    {"updates", "Installed updates", RecordTable{"installed_updates", "", kUpdates}},
    {"services", "Services", RecordTable{"services", "", kServices}},
    {"drivers", "Drivers", RecordTable{"system_drivers", "", kDrivers}},
    {"network", "Network", RecordTable{"network", "", kNetwork}},
    {"registry", "Registry", &AddRegistryTable},
    {"files", "Product files", RecordTable{"product_information", "file_information", kFiles}},
    {"productUpdates", "Product updates", &AddUpdateTimeTable},
    {"package", "Files of the package", &AddPackageTable},
    {"collectors", "Collectors", RecordTable{kManifestName, "collectors", kCollectors}},
    {"partitions", "Drives", RecordTable{"storage", "Partitions", kPartitions}},
    {"disks", "Disks", RecordTable{"storage", "Disks", kDisks}},
    {"modules", "Modules of the processes", &AddModuleTable},
    {"handles", "Handles of the processes", &AddHandleTable},
    {"scanCache", "Scan cache", RecordTable{"product_information", "smart_db", kScanCache}},
};

void AddRecordTable(TableContext& context, const TableEntry& entry, const RecordTable& source) {
  const Json::Value& document = context.collection.Document(source.document);
  const Json::Value& array = *source.member == '\0' ? document : Member(document, source.member);
  if (!array.isArray()) return;
  context.Take(source.document, source.member);
  Table table = context.MakeTable(entry.id);
  AddRecords(table, std::string(source.document) + ".json", source.member, array, source.columns,
             context.collection.utcOffset.value_or(0));
  context.Add(std::move(table));
}

}  // namespace

std::vector<Table> MakeTables(const Collection& collection) {
  TableContext context{collection};
  std::vector<Table>& tables = context.tables;
  for (const TableEntry& entry : kTables) {
    const size_t count = tables.size();
    if (const auto* const records = std::get_if<RecordTable>(&entry.source)) {
      AddRecordTable(context, entry, *records);
    } else {
      std::get<TableFunction>(entry.source)(context);
    }
    if (tables.size() == count) continue;
    tables.back().id = entry.id;
    tables.back().title = entry.title;
  }
  AddOtherTables(context);
  return std::move(context.tables);
}

}  // namespace report
