#include "monitoring/limits.h"

#include <algorithm>
#include <string>

#include "core/text.h"
#include "interfaces/log_constants.h"

namespace st::monitoring {
namespace {

struct Member {
  const char* name;
  std::optional<uint64_t> Limits::*limit;
};
constexpr Member kMembers[] = {
    {"maxDumps", &Limits::maxDumps},
    {"maxDumpsPerProcess", &Limits::maxDumpsPerProcess},
    {"minFreeDiskBytes", &Limits::minFreeDiskBytes},
    {"maxTotalDumpBytes", &Limits::maxTotalDumpBytes},
    {"maxSampleFileBytes", &Limits::maxSampleFileBytes},
};

bool IsWholeNumber(const Json::Value& value) {
  return (value.type() == Json::intValue || value.type() == Json::uintValue) && value.isUInt64();
}

}  // namespace

bool ReadLimits(const Json::Value& document, Limits& limits, const NoteSink& note) {
  const auto fail = [&](const std::wstring& text) {
    note({LOG_LEVEL_ERROR, L"st::monitoring::ReadLimits", text});
    return false;
  };
  const Json::Value& object = document["limits"];
  if (object.isNull()) return true;
  if (!object.isObject()) return fail(L"limits is not an object");
  for (const std::string& name : object.getMemberNames()) {
    if (name == "$comment") continue;
    const auto* const member = std::find_if(std::begin(kMembers), std::end(kMembers),
                                            [&name](const Member& known) { return known.name == name; });
    if (member == std::end(kMembers)) return fail(L"there is no limit " + ToWide(name));
    if (!IsWholeNumber(object[name])) return fail(L"limit " + ToWide(name) + L" is not a whole number from 0 on");
    limits.*(member->limit) = object[name].asUInt64();
  }
  return true;
}

}  // namespace st::monitoring
