#include "systeminfo/disk_collector.h"

#include <gmock/gmock.h>

#include <thread>

#include "core/format.h"
#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/wmi_wrapper.h"
#include "tests/support/fake_wmi.h"

namespace systeminfo {
namespace {

using fake_wmi::Flag;
using fake_wmi::Nothing;
using fake_wmi::Number;
using fake_wmi::Text;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

constexpr wchar_t kDisks[] = L"SELECT * FROM Win32_DiskDrive";
constexpr wchar_t kPartitions[] = L"SELECT * FROM Win32_LogicalDisk";

Json::Value Collect(const std::shared_ptr<WMIWrapper>& wmi) {
  DiskCollector collector(L"storage");
  collector.Start(nullptr, wmi, nullptr);
  return collector.GetData();
}

Json::Value Collect(FakeWmi& fake) {
  return Collect(std::make_shared<WMIWrapper>(fake.Services()));
}

TEST(DiskCollector, DisksThenPartitionsUnderTheirOwnNames) {
  logging::ErrorCapture errors;
  FakeWmi fake;
  fake.answers[kDisks].instances = {
      {{L"Model", Text(L"Disk")}, {L"Partitions", Number(3)}, {L"BytesPerSector", Number(512)}}};
  const fake_wmi::Instance fixed = {{L"DeviceID", Text(L"C:")},     {L"Description", Text(L"Local Fixed Disk")},
                                    {L"Compressed", Flag(false)},   {L"FileSystem", Text(L"NTFS")},
                                    {L"Size", Text(L"5000000000")}, {L"FreeSpace", Text(L"4000000000")},
                                    {L"VolumeName", Text(L"S")},    {L"VolumeSerialNumber", Text(L"1A2B3C4D")}};
  fake_wmi::Instance empty = fixed;
  for (const wchar_t* property : {L"Compressed", L"FileSystem", L"Size", L"FreeSpace", L"VolumeName"})
    empty[property] = Nothing();
  fake.answers[kPartitions].instances = {fixed, empty};

  const Json::Value data = Collect(fake);
  EXPECT_THAT(fake.queries, ElementsAre(kDisks, kPartitions));
  EXPECT_EQ(data.size(), 2u);
  const Json::Value& disk = data["Disks"][0];
  EXPECT_EQ(disk.size(), 3u);
  EXPECT_EQ(disk["Model"], "Disk");
  EXPECT_EQ(disk["Partitions"], 3u);
  EXPECT_EQ(disk["BytesPerSector"], 512u);

  const struct {
    const char* member;
    Json::Value ofFixed, ofEmpty;
  } members[] = {{"Drive Letter", "C:", "C:"}, {"Description", "Local Fixed Disk", "Local Fixed Disk"},
                 {"Compressed", 0, {}},        {"File System", "NTFS", {}},
                 {"Size", "5000000000", {}},   {"Free Space", "4000000000", {}},
                 {"VolumeName", "S", {}},      {"VolumeSerialNumber", "1A2B3C4D", "1A2B3C4D"}};
  ASSERT_EQ(data["Partitions"].size(), 2u);
  for (const Json::Value& partition : data["Partitions"])
    EXPECT_EQ(partition.size(), std::size(members));
  for (const auto& row : members) {
    EXPECT_EQ(data["Partitions"][0][row.member], row.ofFixed) << row.member;
    EXPECT_EQ(data["Partitions"][1][row.member], row.ofEmpty) << row.member;
  }
  EXPECT_THAT(errors.Take(), IsEmpty());
}

TEST(DiskCollector, FailedQueryCostsItsOwnArrayOnly) {
  logging::ErrorCapture errors;
  FakeWmi fake;
  EXPECT_EQ(Collect(fake)["Disks"].type(), Json::arrayValue) << "no disks are an empty array";

  fake.answers[kDisks].queryStatus = WBEM_E_FAILED;
  fake.answers[kPartitions].instances = {{{L"DeviceID", Text(L"C:")}}};
  const Json::Value data = Collect(fake);
  EXPECT_THAT(data.getMemberNames(), ElementsAre("Partitions"));
  EXPECT_EQ(data["Partitions"][0]["Drive Letter"], "C:");
  EXPECT_TRUE(data["Partitions"][0]["Size"].isNull());
  EXPECT_THAT(errors.Take(), SizeIs(1 + 7)) << "the query, and the properties that the class lacks";

  fake.answers[kPartitions].endStatus = WBEM_E_FAILED;
  EXPECT_THAT(Collect(fake)["Partitions"], SizeIs(1)) << "what came before the failure";
  fake.answers[kPartitions].instances.clear();
  EXPECT_TRUE(Collect(fake).isNull());
}

TEST(DiskCollector, LiveSystemDriveIsTheOneOfTheVolume) {
  std::thread([] {
    auto wmi = std::make_shared<WMIWrapper>();
    ASSERT_EQ(wmi->Init(), 0);
    const Json::Value data = Collect(wmi);
    EXPECT_THAT(data["Disks"], SizeIs(testing::Ge(1u)));
    DWORD serial = 0;
    wchar_t fileSystem[32] = {};
    ASSERT_TRUE(GetVolumeInformationW(L"C:\\", nullptr, 0, &serial, nullptr, nullptr, fileSystem, 32));
    Json::Value system;
    for (const Json::Value& partition : data["Partitions"])
      if (partition["Drive Letter"] == "C:") system = partition;
    EXPECT_EQ(system["VolumeSerialNumber"].asString(), ToUtf8(Format(L"%08X", serial)));
    EXPECT_EQ(system["File System"].asString(), ToUtf8(fileSystem));
  }).join();
}

}  // namespace
}  // namespace systeminfo
