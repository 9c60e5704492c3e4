#include "systeminfo/collection_manifest.h"

#include <windows.h>

#include <cstdio>

#include "core/files.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/text.h"

namespace systeminfo {
namespace {

const char* OutcomeName(Outcome outcome) {
  switch (outcome) {
    case Outcome::kData:
      return "data";
    case Outcome::kNoData:
      return "no data";
    case Outcome::kFailed:
      return "failed";
    case Outcome::kNotWritten:
      return "not written";
    case Outcome::kTimedOut:
      return "timed out";
  }
  return "";
}

Json::Value CollectorEntry(const CollectorOutcome& collector) {
  Json::Value entry(Json::objectValue);
  entry["name"] = ToUtf8(collector.name);
  entry["class"] = ToUtf8(collector.className);
  entry["outcome"] = OutcomeName(collector.outcome);
  if (!collector.reason.empty()) entry["reason"] = ToUtf8(collector.reason);
  entry["records"] = Json::UInt64{collector.records};
  entry["bytes"] = Json::UInt64{collector.bytes};
  entry["milliseconds"] = Json::UInt64{collector.milliseconds};
  entry["errors"] = Json::Value(Json::arrayValue);
  for (const std::wstring& line : collector.errors)
    entry["errors"].append(ToUtf8(line));
  return entry;
}

}  // namespace

uint64_t CountRecords(const Json::Value& data) {
  if (data.isNull()) return 0;
  if (data.isArray()) return data.size();
  if (!data.isObject()) return 1;
  uint64_t elements = 0;
  bool hasArrays = false;
  for (const Json::Value& member : data) {
    if (!member.isArray()) continue;
    hasArrays = true;
    elements += member.size();
  }
  return hasArrays ? elements : 1;
}

Json::Value BuildManifest(const ManifestHeader& header, const std::vector<CollectorOutcome>& collectors) {
  Json::Value manifest(Json::objectValue);
  manifest["tool_version"] = header.toolVersion;
  manifest["start"] = header.startUtc;
  manifest["end"] = header.endUtc;
  manifest["utc_offset_minutes"] = header.utcOffsetMinutes;
  manifest["collectors"] = Json::Value(Json::arrayValue);
  for (const CollectorOutcome& collector : collectors)
    manifest["collectors"].append(CollectorEntry(collector));
  return manifest;
}

bool WriteManifest(std::wstring_view folder, const ManifestHeader& header,
                   const std::vector<CollectorOutcome>& collectors) {
  const qx::PathString path = JoinPath(folder, L"collection_manifest.json");
  const std::string text = WriteStyledJson(BuildManifest(header, collectors));
  const DWORD error = WriteWholeFile(path, std::string_view(text));
  if (error == ERROR_SUCCESS) return true;
  LOG_ERROR(L"systeminfo::WriteManifest", L"Failed to write %s, error %u", path.c_str(), error);
  return false;
}

std::string CurrentTimeUtc() {
  SYSTEMTIME now{};
  GetSystemTime(&now);
  char text[32] = {};
  std::snprintf(text, sizeof text, "%04u-%02u-%02uT%02u:%02u:%02uZ", unsigned{now.wYear}, unsigned{now.wMonth},
                unsigned{now.wDay}, unsigned{now.wHour}, unsigned{now.wMinute}, unsigned{now.wSecond});
  return text;
}

int CurrentUtcOffset() {
  TIME_ZONE_INFORMATION zone{};
  const DWORD part = GetTimeZoneInformation(&zone);
  if (part == TIME_ZONE_ID_INVALID) {
    LOG_ERROR(L"systeminfo::CurrentUtcOffset", L"GetTimeZoneInformation() %u", GetLastError());
    return 0;
  }
  const LONG ofSeason = part == TIME_ZONE_ID_DAYLIGHT   ? zone.DaylightBias
                        : part == TIME_ZONE_ID_STANDARD ? zone.StandardBias
                                                        : 0;
  return static_cast<int>(-(zone.Bias + ofSeason));
}

}  // namespace systeminfo
