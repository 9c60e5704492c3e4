// A list file.
#include "systeminfo/list_file.h"

#include "core/text.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  const auto list = systeminfo::ParseListFile(bytes);
  PROMISE(list.isText == (bytes.find('\0') == std::string_view::npos));
  PROMISE(list.isText || list.lines.empty());
  for (const std::string& line : list.lines) {
    PROMISE(!line.empty() && Trimmed(line) == line);
    PROMISE(line.find('\n') == std::string::npos && bytes.find(line) != std::string_view::npos);
  }
}
