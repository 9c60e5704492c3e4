#include "systeminfo/list_file.h"

#include <algorithm>

#include "core/text.h"

namespace systeminfo {

ListLines ParseListFile(std::string_view bytes) {
  constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";
  if (bytes.find('\0') != std::string_view::npos) return {false, {}};
  if (bytes.starts_with(kByteOrderMark)) bytes.remove_prefix(kByteOrderMark.size());
  ListLines result;
  while (!bytes.empty()) {
    const size_t end = std::min(bytes.find('\n'), bytes.size());
    const std::string_view line = Trimmed(bytes.substr(0, end));
    bytes.remove_prefix(std::min(end + 1, bytes.size()));
    if (!line.empty()) result.lines.emplace_back(line);
  }
  return result;
}

}  // namespace systeminfo
