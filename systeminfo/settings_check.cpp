#include "systeminfo/settings_check.h"

#include <algorithm>
#include <cstddef>

#include "core/edit_distance.h"
#include "core/text.h"

namespace systeminfo {
namespace {

constexpr size_t kFarthest = 2;
constexpr const char* kRunKeys[] = {"output_folder", "pretty_print", "all_collectors", "collector_timeout"};

}  // namespace

std::vector<UnknownKey> FindUnknownKeys(const Json::Value& document, std::span<const std::string> collectorKeys) {
  std::vector<UnknownKey> unknown;
  if (!document.isObject()) return unknown;
  std::vector<std::string> known(collectorKeys.begin(), collectorKeys.end());
  known.insert(known.end(), std::begin(kRunKeys), std::end(kRunKeys));
  for (auto member = document.begin(); member != document.end(); ++member) {
    const std::string key = member.name();
    const bool isOff = member->isBool() && !member->asBool();
    if (isOff || std::find(known.begin(), known.end(), key) != known.end()) continue;
    unknown.push_back({key, NearestKey(key, known)});
  }
  return unknown;
}

std::string NearestKey(std::string_view key, std::span<const std::string> candidates) {
  std::string nearest;
  size_t least = kFarthest + 1;
  for (const std::string& candidate : candidates) {
    const size_t longer = std::max(key.size(), candidate.size());
    if (longer - std::min(key.size(), candidate.size()) > kFarthest) continue;  // also bounds the work on a huge key
    if (const size_t distance = EditDistance(ToWide(key), ToWide(candidate)); distance < least) {
      least = distance;
      nearest = candidate;
    }
  }
  return nearest;
}

}  // namespace systeminfo
