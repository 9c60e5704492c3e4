// Registry keys as JSON: the values of one key, or a key with everything below it.
#pragma once

#include <json/value.h>

#include <atomic>

#include "systeminfo/utils/registry_key.h"

namespace utils {

// An object of value name, in lower case, to value text; every member is a string. Empty for a key without values and
// for one that could not be opened.
Json::Value ValuesAsJson(const RegistryKey& key);

// "values" (as above) and "subkeys", an object of subkey name to such a dump again; either is left out when it would be
// empty. A subkey that cannot be opened is logged and left out. Symbolic links are followed, but not a second time
// below one, so that links in a circle end; what lies deeper than kDeepestDump levels is logged and left out. Ends
// early, with what there is, when `*cancel` is set.
Json::Value DumpKey(const RegistryKey& key, const std::atomic<bool>* cancel);

// A level takes two levels of JSON, of which common readers take 1,000 at most.
inline constexpr int kDeepestDump = 480;

}  // namespace utils
