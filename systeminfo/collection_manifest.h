// The table of contents of a collected package: which collectors ran, what came of each, and the errors that were
// logged meanwhile. Whoever reads a package sees at once why a file is missing. Written beside the collectors' files as
// "collection_manifest.json".
#pragma once

#include <json/value.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace systeminfo {

enum class Outcome {
  kData,        // the file is written
  kNoData,      // the collector found nothing
  kFailed,      // the collector threw; there is no file
  kNotWritten,  // there were data, but no file could be written
  kTimedOut,    // it took too long; there is a file when it had gathered something and ended when it was asked to
};

struct CollectorOutcome {
  std::wstring name;       // the settings key and base name of the file
  std::wstring className;  // tells collectors of one name apart
  Outcome outcome = Outcome::kNoData;
  std::wstring reason;  // why there is no file, or not a whole one; empty for kData
  uint64_t records = 0;
  uint64_t bytes = 0;                // of the file
  uint64_t milliseconds = 0;         // collecting and writing
  std::vector<std::wstring> errors;  // the log lines of level error and above that came meanwhile
};

// How many records a collector's data hold: the elements of an array; of an object with arrays among its members, the
// elements of those arrays together; 1 for any other value, 0 for null.
uint64_t CountRecords(const Json::Value& data);

struct ManifestHeader {
  std::string toolVersion;
  std::string startUtc;  // ISO 8601, as CurrentTimeUtc gives it
  std::string endUtc;
  int utcOffsetMinutes = 0;  // how far local time is ahead of UTC, as in the event logs of the collection
};

Json::Value BuildManifest(const ManifestHeader& header, const std::vector<CollectorOutcome>& collectors);

// Writes the manifest into the folder, indented, whatever the settings say of the other files. False, with a logged
// error, when it cannot be written.
bool WriteManifest(std::wstring_view folder, const ManifestHeader& header,
                   const std::vector<CollectorOutcome>& collectors);

std::string CurrentTimeUtc();  // "2024-05-31T09:08:07Z"
int CurrentUtcOffset();        // minutes

}  // namespace systeminfo
