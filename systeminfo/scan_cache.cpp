#include "systeminfo/scan_cache.h"

#include "core/files.h"
#include "core/format.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/text.h"
#include "systeminfo/collector.h"
#include "systeminfo/file_reference.h"

namespace systeminfo {
namespace {

constexpr wchar_t kScope[] = L"GetDataBaseInformation";

// False, and logged, when there is nothing to report.
bool ReadScanCache(const std::wstring& path, ScanCache& cache) {
  const KernelHandle file = OpenForReading(path);
  DWORD error = GetLastError();
  if (!file) {
    LOG_ERROR(kScope, L"Error opening the smart db ntfs file %s!", path.c_str());
    LOG_ERROR(kScope, L"error %u", error);
    return false;
  }
  std::string bytes;
  error = ReadBytes(file.Get(), kScanCacheRecordsOffset + kMostReportedRecords * kScanCacheRecordSize, bytes);
  if (error == ERROR_SUCCESS) cache = ParseScanCache(bytes, kMostReportedRecords);
  if (!cache.hasHeader) {
    LOG_ERROR(kScope, L"Error reading the smart db ntfs file %s!", path.c_str());
    LOG_ERROR(kScope, L"error %u", error == ERROR_SUCCESS ? ERROR_HANDLE_EOF : error);
    return false;
  }
  LOG_TRACE(kScope, L"Getdatabase information entries %d", cache.entryCount);
  if (cache.isCutShort) {
    LOG_ERROR(kScope, L"Less than sizeof( CacheInfoNTFS ) in file;");
  } else if (cache.entryCount > kMostReportedRecords) {
    LOG_WARNING(kScope, L"Only the first %u entries are reported", static_cast<uint32_t>(kMostReportedRecords));
  }
  return true;
}

}  // namespace

Json::Value GetDataBaseInformation(const std::wstring& installFolder, const std::atomic<bool>* cancel) {
  Json::Value result(Json::arrayValue);
  ScanCache cache;
  if (!ReadScanCache(std::wstring(JoinPath(installFolder, L"ThreatScanner\\smartdb-ntfs.db")), cache)) return result;
  FileReferences files;
  for (const ScanCacheRecord& record : cache.records) {
    if (IsCancelled(cancel)) break;
    const std::optional<std::wstring> path = files.PathOf(record.volumeSerialNumber, record.fileReferenceNumber);
    if (!path) LOG_TRACE(kScope, L"FRN\t - %llu Error cannot build path", record.fileReferenceNumber);
    result.append(ScanCacheRecordAsJson(record, path));
  }
  return result;
}

Json::Value ScanCacheRecordAsJson(const ScanCacheRecord& record, const std::optional<std::wstring>& path) {
  Json::Value json(Json::objectValue);
  json["file_reference_number"] = ToUtf8(Format(L"%llX", record.fileReferenceNumber));
  json["path"] = path ? ToUtf8(*path) : std::string();
  json["references"] = record.references;
  json["key_and_scan"] = record.keyAndScan;
  json["scan_phase"] = Json::UInt{record.scanPhase};
  json["flag_from_dat"] = Json::UInt{record.flagFromDat};
  json["cloud_flags"] = record.cloudFlags;
  json["latime"] = Json::UInt64{record.lastAccessTime};
  json["lstime"] = Json::UInt64{record.lastScanTime};
  json["uInternalFlags"] = record.internalFlags;
  json["uExtraFlags1"] = Json::UInt{record.extraFlags1};
  json["uExtraFlags2"] = Json::UInt{record.extraFlags2};
  json["db_key_1"] = record.databaseKeys[0];
  json["db_key_2"] = record.databaseKeys[1];
  json["db_key_3"] = record.databaseKeys[2];
  json["opt_scan_email"] = record.scanEmail;
  json["opt_scan_packed"] = record.scanPacked;
  json["opt_scan_archives"] = record.scanArchives;
  json["opt_deep_scan"] = record.deepScan;
  json["opt_max_archive_depth_level"] = Json::UInt{record.maxArchiveDepthLevel};
  json["opt_max_archive_file_size"] = record.maxArchiveFileSize;
  return json;
}

}  // namespace systeminfo
