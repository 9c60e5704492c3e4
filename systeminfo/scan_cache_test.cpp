#include "systeminfo/scan_cache.h"

#include <gmock/gmock.h>
#include <json/writer.h>

#include "core/files.h"
#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/file_reference.h"
#include "tests/support/scan_cache_file.h"
#include "tests/support/test_folder.h"

namespace systeminfo {
namespace {

using scan_cache_file::FileBytes;
using testing::Contains;
using testing::HasSubstr;

// Every field its own value, the upper bits of each set.
ScanCacheRecord DistinctRecord() {
  ScanCacheRecord record;
  record.fileReferenceNumber = 0xFEDCBA9876543210;
  record.volumeSerialNumber = 0x81000001;
  record.references = 0x82000002;
  record.keyAndScan = 0x83000003;
  record.scanPhase = 0x8404;
  record.flagFromDat = 0x8505;
  record.cloudFlags = 0x86000006;
  record.internalFlags = 0x87000007;
  record.lastAccessTime = 0x8800000000000008;
  record.lastScanTime = 0x8900000000000009;
  record.extraFlags1 = 0x8A0A;
  record.extraFlags2 = 0x8B0B;
  record.databaseKeys[0] = 0x8C00000C;
  record.databaseKeys[1] = 0x8D00000D;
  record.databaseKeys[2] = 0x8E00000E;
  record.scanPacked = true;
  record.deepScan = true;
  record.maxArchiveDepthLevel = 0x8F;
  record.maxArchiveFileSize = 0x90000010;
  return record;
}

TEST(ScanCacheFormat, EveryFieldComesFromItsPlace) {
  const ScanCache cache = ParseScanCache(FileBytes(2, {DistinctRecord(), ScanCacheRecord()}), 10);
  ASSERT_EQ(cache.records.size(), 2u);
  const Json::Value json = ScanCacheRecordAsJson(cache.records[0], L"C:\\f");
  const std::pair<const char*, Json::Value> expected[] = {
      {"file_reference_number", "FEDCBA9876543210"},
      {"path", "C:\\f"},
      {"references", 0x82000002u},
      {"key_and_scan", 0x83000003u},
      {"scan_phase", 0x8404u},
      {"flag_from_dat", 0x8505u},
      {"cloud_flags", 0x86000006u},
      {"latime", Json::UInt64{0x8800000000000008}},
      {"lstime", Json::UInt64{0x8900000000000009}},
      {"uInternalFlags", 0x87000007u},
      {"uExtraFlags1", 0x8A0Au},
      {"uExtraFlags2", 0x8B0Bu},
      {"db_key_1", 0x8C00000Cu},
      {"db_key_2", 0x8D00000Du},
      {"db_key_3", 0x8E00000Eu},
      {"opt_scan_email", false},
      {"opt_scan_packed", true},
      {"opt_scan_archives", false},
      {"opt_deep_scan", true},
      {"opt_max_archive_depth_level", 0x8Fu},
      {"opt_max_archive_file_size", 0x90000010u},
  };
  EXPECT_EQ(json.size(), std::size(expected));
  for (const auto& [name, value] : expected)
    EXPECT_EQ(json[name], value) << name;
  EXPECT_EQ(cache.records[0].volumeSerialNumber, 0x81000001u);
  const Json::Value empty = ScanCacheRecordAsJson(cache.records[1], std::nullopt);
  EXPECT_EQ(empty["path"], "");
  EXPECT_EQ(empty["opt_max_archive_file_size"], 0u);
}

// A file of the test folder by its reference.
ScanCacheRecord RecordOf(const std::wstring& path) {
  ScanCacheRecord record;
  const KernelHandle file = OpenForReading(path);
  BY_HANDLE_FILE_INFORMATION info{};
  EXPECT_TRUE(GetFileInformationByHandle(file.Get(), &info));
  record.fileReferenceNumber = uint64_t{info.nFileIndexHigh} << 32 | info.nFileIndexLow;
  DWORD serial = 0;
  EXPECT_TRUE(GetVolumeInformationW(path.substr(0, 3).c_str(), nullptr, 0, &serial, nullptr, nullptr, nullptr, 0));
  record.volumeSerialNumber = serial;
  return record;
}

TEST(GetDataBaseInformation, RecordsComeWithThePathsOfTheirFiles) {
  const TestFolder folder;
  const ScanCacheRecord present = RecordOf(folder.MakeFile(L"sc\u00E4nned \u6771.exe"));
  ScanCacheRecord deleted = present;
  deleted.fileReferenceNumber = 0x00FF'FFFF'FFFF'FFF0;
  ScanCacheRecord elsewhere = present;
  elsewhere.volumeSerialNumber ^= 0x5A5A5A5A;
  folder.MakeFile(L"ThreatScanner\\smartdb-ntfs.db", FileBytes(4, {present, deleted, elsewhere, elsewhere}));

  logging::ErrorCapture lines(logging::Level::kTrace);
  const Json::Value records = GetDataBaseInformation(folder.Path(), nullptr);
  const std::vector<std::wstring> text = lines.Take();
  ASSERT_EQ(records.size(), 4u);
  EXPECT_THAT(records[0]["path"].asString(), HasSubstr(ToUtf8(L"sc\u00E4nned \u6771.exe")));
  EXPECT_TRUE(PathExists(ToWide(records[0]["path"].asString()))) << records[0]["path"];
  EXPECT_EQ(records[1]["path"], "");
  EXPECT_EQ(records[2]["path"], "");
  EXPECT_THAT(text, Contains(L"GetDataBaseInformation: Getdatabase information entries 4"));
  EXPECT_THAT(text, Contains(L"GetDataBaseInformation: FRN\t - 72057594037927920 Error cannot build path").Times(1));
  EXPECT_THAT(text, Contains(HasSubstr(L"could not find a volume for ")).Times(1));

  const std::atomic<bool> cancelled = true;
  EXPECT_EQ(GetDataBaseInformation(folder.Path(), &cancelled), Json::Value(Json::arrayValue));
}

TEST(GetDataBaseInformation, UnusableFilesAreAnEmptyArrayAndALogLine) {
  const TestFolder folder;
  const std::wstring file = folder.Path(L"ThreatScanner\\smartdb-ntfs.db");
  const auto linesOfRun = [&] {
    logging::ErrorCapture errors;
    EXPECT_EQ(GetDataBaseInformation(folder.Path(), nullptr), Json::Value(Json::arrayValue));
    return errors.Take();
  };
  const std::wstring scope = L"GetDataBaseInformation: ";
  EXPECT_THAT(linesOfRun(), Contains(scope + L"Error opening the smart db ntfs file " + file + L"!"));
  folder.MakeFile(L"ThreatScanner\\smartdb-ntfs.db");
  EXPECT_THAT(linesOfRun(), Contains(scope + L"Error reading the smart db ntfs file " + file + L"!"));
  folder.MakeFile(L"ThreatScanner\\smartdb-ntfs.db", FileBytes(UINT32_MAX, {}));
  EXPECT_THAT(linesOfRun(), Contains(scope + L"Less than sizeof( CacheInfoNTFS ) in file;"));
  DeleteFileW(file.c_str());
  folder.MakeFolder(L"ThreatScanner\\smartdb-ntfs.db");
  EXPECT_THAT(linesOfRun(), Contains(HasSubstr(L"Error opening")));
}

TEST(GetDataBaseInformation, WhatDoesNotFitIntoTheReportIsLeftOutAloud) {
  const TestFolder folder;
  std::vector<ScanCacheRecord> records(kMostReportedRecords + 1);
  folder.MakeFile(L"ThreatScanner\\smartdb-ntfs.db", FileBytes(static_cast<uint32_t>(records.size()), records));
  logging::ErrorCapture lines(logging::Level::kWarning);
  EXPECT_EQ(GetDataBaseInformation(folder.Path(), nullptr).size(), kMostReportedRecords);
  EXPECT_THAT(lines.Take(), Contains(HasSubstr(L"Only the first 20000 entries are reported")));
}

}  // namespace
}  // namespace systeminfo
