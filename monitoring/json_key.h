// The one check that every key of the monitoring configuration goes through.
#pragma once

#include <json/value.h>

#include "monitoring/note.h"

namespace st::util {

// True only when `value` is an object whose member `key` has exactly the type `expected`: 5.0 is no integer. An absent
// or null member is false without a note; any other type is false with one.
bool JsonKeyWithValueTypeExists(const Json::Value& value, const char* key, Json::ValueType expected,
                                const monitoring::NoteSink& note);

}  // namespace st::util
