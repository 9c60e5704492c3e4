// The product's scan cache as the report shows it: the records of "smartdb-ntfs.db", each with the path of its file.
// The layout of the file is in scan_cache_format.h.
#pragma once

#include <json/value.h>

#include <atomic>
#include <cstddef>
#include <optional>
#include <string>

#include "systeminfo/scan_cache_format.h"

namespace systeminfo {

// What a cache holds beyond that is left out, with a log line: the report has to fit into the archive.
inline constexpr size_t kMostReportedRecords = 20'000;

// An array with an object for each record of the file in the folder "ThreatScanner" of the product. Empty when there is
// no such file or it cannot be read; ends early, with what there is, when `*cancel` is set. Failures are logged.
Json::Value GetDataBaseInformation(const std::wstring& installFolder, const std::atomic<bool>* cancel);

// One element of that array. Without a path, the member "path" is empty.
Json::Value ScanCacheRecordAsJson(const ScanCacheRecord& record, const std::optional<std::wstring>& path);

}  // namespace systeminfo
