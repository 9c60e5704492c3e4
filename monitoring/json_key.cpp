#include "monitoring/json_key.h"

#include "interfaces/log_constants.h"

namespace st::util {

bool JsonKeyWithValueTypeExists(const Json::Value& value, const char* key, Json::ValueType expected,
                                const monitoring::NoteSink& note) {
  if (!value.isObject()) return false;
  const Json::ValueType actual = value[key].type();
  if (actual == Json::nullValue) return false;
  if (actual == expected) return true;
  note({LOG_LEVEL_TRACE, L"st::util::JsonKeyWithValueTypeExists",
        L"expected " + std::to_wstring(static_cast<int>(expected)) + L" have " +
            std::to_wstring(static_cast<int>(actual))});
  return false;
}

}  // namespace st::util
