#include "core/json.h"

#include <json/reader.h>
#include <json/writer.h>

#include <exception>

// Json::Reader, StyledWriter and FastWriter are marked as deprecated in the library, but they define the layout of the
// program's files, which people compare and scripts read. The build silences the warning for this file only.

bool ParseJson(std::string_view text, Json::Value& value, std::string& error) {
  constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
  if (text.starts_with(kByteOrderMark)) text.remove_prefix(kByteOrderMark.size());
  value = Json::Value();
  try {
    Json::Reader reader;
    if (reader.parse(text.data(), text.data() + text.size(), value, false)) return true;
    error = reader.getFormattedErrorMessages();
  } catch (const std::exception& exception) {  // nesting beyond the reader's stack limit
    error = exception.what();
  }
  value = Json::Value();
  return false;
}

std::string WriteStyledJson(const Json::Value& value) {
  return Json::StyledWriter().write(value);
}

std::string WriteCompactJson(const Json::Value& value) {
  return Json::FastWriter().write(value);
}
