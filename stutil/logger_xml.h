// Reads and changes the two settings of a logger configuration that say how much is logged. Text in, text out; nothing
// here opens a file. Everything but the two elements stays as it is: comments, attributes, texts. Only the layout is
// made anew, a line for each element: the reader does not keep the blanks between them.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace stutil {

// The texts of the elements "depth" and "level" under "configuration", UTF-8. Without a value the element is absent.
struct LoggerLevels {
  std::optional<std::string> depth;
  std::optional<std::string> level;

  bool operator==(const LoggerLevels&) const = default;
};

struct LoggerXml {
  LoggerLevels levels;
  std::string folder;  // the configured log folder
};

// Nothing when the text is not one whole XML document or has no element "configuration".
std::optional<LoggerXml> ReadLoggerXml(std::string_view text);

// The text with these two settings; an element that is missing is added, one without a value is taken out.
std::optional<std::string> WithLoggerLevels(std::string_view text, const LoggerLevels& levels);

}  // namespace stutil
