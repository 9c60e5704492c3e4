#include "systeminfo/list_file.h"

#include <algorithm>

namespace systeminfo {

ListLines ParseListFile(std::string_view bytes) {
  constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
  constexpr std::string_view kBlanks = " \t\r";
  if (bytes.find('\0') != std::string_view::npos) return {false, {}};
  if (bytes.starts_with(kByteOrderMark)) bytes.remove_prefix(kByteOrderMark.size());
  ListLines result;
  while (!bytes.empty()) {
    const size_t end = std::min(bytes.find('\n'), bytes.size());
    const std::string_view line = bytes.substr(0, end);
    bytes.remove_prefix(std::min(end + 1, bytes.size()));
    const size_t first = line.find_first_not_of(kBlanks);
    if (first == std::string_view::npos) continue;
    result.lines.emplace_back(line.substr(first, line.find_last_not_of(kBlanks) - first + 1));
  }
  return result;
}

}  // namespace systeminfo
