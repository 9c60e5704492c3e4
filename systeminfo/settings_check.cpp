#include "systeminfo/settings_check.h"

#include <algorithm>
#include <cstddef>

namespace systeminfo {
namespace {

constexpr size_t kFarthest = 2;
constexpr const char* kRunKeys[] = {"output_folder", "pretty_print", "all_collectors", "collector_timeout"};

char Lower(char c) {
  return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

// The number of inserted, dropped and changed characters between two texts.
size_t EditDistance(std::string_view a, std::string_view b) {
  std::vector<size_t> row(b.size() + 1);  // distances of a's first i characters to b's first j
  for (size_t j = 0; j <= b.size(); ++j)
    row[j] = j;
  for (size_t i = 1; i <= a.size(); ++i) {
    size_t diagonal = row[0];
    row[0] = i;
    for (size_t j = 1; j <= b.size(); ++j) {
      const size_t changed = diagonal + (Lower(a[i - 1]) == Lower(b[j - 1]) ? 0 : 1);
      diagonal = row[j];
      row[j] = std::min({row[j] + 1, row[j - 1] + 1, changed});
    }
  }
  return row[b.size()];
}

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
    if (const size_t distance = EditDistance(key, candidate); distance < least) {
      least = distance;
      nearest = candidate;
    }
  }
  return nearest;
}

}  // namespace systeminfo
