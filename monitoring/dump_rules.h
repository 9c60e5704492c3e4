// Which processes a dump action means, and whether a written dump is whole. No Windows header.
#pragma once

#include <json/value.h>

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "monitoring/note.h"

namespace st::monitoring {

struct DumpTarget {
  std::optional<uint32_t> pid;  // beats `name`
  std::wstring name;            // a piece of the image's full path
};

// The parameters of an action of type "dump". Nothing, with a note, when they name no process.
std::optional<DumpTarget> ReadDumpTarget(const Json::Value& parameters, const NoteSink& note);

// Whether a file of `size` bytes that begins with `beginning` has the signature of a minidump and every part that its
// directory tells of: a full disk cuts a dump off, and not every writer says so.
bool IsWholeDump(std::string_view beginning, uint64_t size);

inline constexpr size_t kDumpBeginning = size_t{64} << 10;  // bytes; as much of the file as IsWholeDump may look at

}  // namespace st::monitoring
