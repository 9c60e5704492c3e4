#include "core/json.h"

#include <json/reader.h>

#include <exception>

// Json::Reader is marked as deprecated in the library, but it decides what the program accepts, and its messages are
// what the log shows. The build silences the warning for this file only.

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
