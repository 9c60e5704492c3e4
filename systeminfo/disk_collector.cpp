#include "systeminfo/disk_collector.h"

#include <utility>

#include "systeminfo/wmi_table.h"

namespace systeminfo {
namespace {

constexpr wchar_t kStart[] = L"systeminfo::DiskCollector::Start";

constexpr WmiColumn kDiskColumns[] = {{L"Model"}, {L"Partitions"}, {L"BytesPerSector"}};

constexpr WmiColumn kPartitionColumns[] = {
    {L"DeviceID", L"Drive Letter"},
    {L"Description"},
    {L"Compressed"},
    {L"FileSystem", L"File System"},
    {L"Size"},
    {L"FreeSpace", L"Free Space"},
    {L"VolumeName"},
    {L"VolumeSerialNumber"},
};

struct DiskTable {
  const char* member;
  WmiTable table;
};

constexpr DiskTable kTables[] = {
    {"Disks", {L"SELECT * FROM Win32_DiskDrive", kDiskColumns, Hole::kIsNull, kStart}},
    {"Partitions", {L"SELECT * FROM Win32_LogicalDisk", kPartitionColumns, Hole::kIsNull, kStart}},
};

}  // namespace

void DiskCollector::Start(const std::shared_ptr<CollectingSettings>&, const std::shared_ptr<WMIWrapper>& wmi,
                          const std::atomic<bool>*) {
  for (const DiskTable& disk : kTables) {
    Json::Value rows;
    const bool complete = ReadWmiTable(*wmi, disk.table, rows);
    // An empty array says that there is no such disk, which a failed query does not know.
    if (complete || !rows.empty()) m_data[disk.member] = std::move(rows);
  }
}

}  // namespace systeminfo
