#include "monitoring/dump_rules.h"

#include <cstring>

#include "core/text.h"
#include "interfaces/log_constants.h"

namespace st::monitoring {
namespace {

// A number as a process id is written; a fraction is cut off. A negative one is an id that no process has.
std::optional<uint32_t> ProcessId(const Json::Value& value) {
  if (!value.isNumeric()) return std::nullopt;
  const double number = value.asDouble();
  if (!(number > -2147483649.0 && number < 4294967296.0)) return std::nullopt;
  return static_cast<uint32_t>(static_cast<int64_t>(number));
}

uint32_t Number(std::string_view bytes, size_t offset) {
  uint32_t number = 0;
  std::memcpy(&number, bytes.data() + offset, sizeof number);
  return number;
}

}  // namespace

std::optional<DumpTarget> ReadDumpTarget(const Json::Value& parameters, const NoteSink& note) {
  const auto fail = [&note](const wchar_t* text) {
    note({LOG_LEVEL_ERROR, L"st::monitoring::ActionDumpProcess::Run", text});
    return std::nullopt;
  };
  if (!parameters.isObject()) return fail(L"the parameters are not an object");
  if (const Json::Value& pid = parameters["pid"]; !pid.isNull()) {
    const std::optional<uint32_t> id = ProcessId(pid);
    if (!id) return fail(L"pid is not a process id");
    return DumpTarget{id, {}};
  }
  const Json::Value& name = parameters["name"];
  if (!name.isString()) return fail(L"the parameters have neither a pid nor a name");
  return DumpTarget{std::nullopt, ToWide(name.asString())};
}

bool IsWholeDump(std::string_view beginning, uint64_t size) {
  // The header: signature, version, number of streams, offset of the directory, ... An entry of the directory: type,
  // size and offset of a stream.
  constexpr size_t kHeader = 32, kEntry = 12;
  if (beginning.size() < kHeader || !beginning.starts_with("MDMP")) return false;
  const uint64_t count = Number(beginning, 8);
  const uint64_t directory = Number(beginning, 12);
  if (count == 0 || directory + count * kEntry > size) return false;
  if (directory + count * kEntry > beginning.size()) return true;  // out of sight
  for (uint64_t entry = directory; entry < directory + count * kEntry; entry += kEntry) {
    const uint64_t streamSize = Number(beginning, entry + 4);
    if (Number(beginning, entry + 8) + streamSize > size) return false;
  }
  return true;
}

}  // namespace st::monitoring
