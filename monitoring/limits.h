// Bounds on what a monitoring run may leave on the disk: the optional member "limits" of the configuration. Whatever is
// not given is not limited. No Windows header.
#pragma once

#include <json/value.h>

#include <cstdint>
#include <optional>

#include "monitoring/note.h"

namespace st::monitoring {

struct Limits {
  std::optional<uint64_t> maxDumps;            // in one run
  std::optional<uint64_t> maxDumpsPerProcess;  // in one run, for each process id
  std::optional<uint64_t> minFreeDiskBytes;    // left on the dumps' disk before a dump begins
  std::optional<uint64_t> maxTotalDumpBytes;   // of all dumps of one run together
  std::optional<uint64_t> maxSampleFileBytes;  // of each counter's sample file
};

inline constexpr uint64_t kDefaultSampleFileBytes = uint64_t{10} << 20;

// Reads the member of a configuration document. False, with a note, when it is not an object of whole numbers from 0 on
// or has a member that is no limit: a limit that was mistyped must not be off in silence.
bool ReadLimits(const Json::Value& document, Limits& limits, const NoteSink& note);

}  // namespace st::monitoring
