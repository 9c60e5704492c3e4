// Any JSON text: what is read can be written, and is written as the library's own writers do it.
#include "core/json.h"

#include <json/writer.h>

#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  Json::Value value;
  std::string error;
  if (!ParseJson(bytes, value, error)) {
    PROMISE(!error.empty() && value.isNull());
    return;
  }
  // The library keeps comments on reading when asked to, and would write them; here there are none.
  const std::string styled = WriteStyledJson(value);
  const std::string compact = WriteCompactJson(value);
  PROMISE(styled == Json::StyledWriter().write(value));
  PROMISE(compact == Json::FastWriter().write(value));

  Json::Value again;
  if (value.isObject() || value.isArray()) PROMISE(ParseJson(compact, again, error));
}
