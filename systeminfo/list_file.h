// List files: plain text, one entry a line, by which a user says where a collector looks.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace systeminfo {

struct ListLines {
  bool isText = true;  // false: there are zero bytes, so this is UTF-16 or no text at all; there are no lines then
  std::vector<std::string> lines;
};

// The lines of UTF-8 text in their order, without blanks around them; lines without anything else are left out. A
// byte-order mark and either kind of line end are accepted.
ListLines ParseListFile(std::string_view bytes);

}  // namespace systeminfo
