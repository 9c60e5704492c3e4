// Packs folders as the program does, for bench.py to measure: pack_bench ARCHIVE [FOLDER...]
// Without a folder it makes an empty archive: the cost of the process alone. Exit status 0 when the archive was made.
#include <cstdio>
#include <string>
#include <vector>

#include "stutil/zip.h"
#include "tests/bench/measure.h"

int wmain(int count, wchar_t** arguments) {
  if (count < 2) {
    std::fputs("usage: pack_bench ARCHIVE [FOLDER...]\n", stderr);
    return 2;
  }
  const std::vector<std::wstring> folders(arguments + 2, arguments + count);
  return Measure([&] { return stutil::CompressWithSizeLimit_MostRecentFirst(folders, arguments[1]); }) ? 0 : 1;
}
