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
  const std::pair<const wchar_t*, const char*> partitionMembers[] = {
      {L"DeviceID", "Drive Letter"},
      {L"Description", "Description"},
      {L"Compressed", "Compressed"},
      {L"FileSystem", "File System"},
      {L"Size", "Size"},
      {L"FreeSpace", "Free Space"},
      {L"VolumeName", "VolumeName"},
      {L"VolumeSerialNumber", "VolumeSerialNumber"},
  };
  FakeWmi fake;
  fake.answers[kDisks].instances = {
      {{L"Model", Text(L"Disk")}, {L"Partitions", Number(3)}, {L"BytesPerSector", Number(512)}}};
  auto& partitions = fake.answers[kPartitions].instances;
  partitions.resize(2);
  Json::Value expected;
  expected["Disks"][0]["Model"] = "Disk";
  expected["Disks"][0]["Partitions"] = 3u;
  expected["Disks"][0]["BytesPerSector"] = 512u;
  for (const auto& [property, member] : partitionMembers) {
    partitions[0][property] = Text(property);
    partitions[1][property] = Nothing();  // a drive without a medium
    expected["Partitions"][0][member] = ToUtf8(property);
    expected["Partitions"][1][member] = Json::Value();
  }
  EXPECT_EQ(Collect(fake), expected);
  EXPECT_THAT(fake.queries, ElementsAre(kDisks, kPartitions));
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
