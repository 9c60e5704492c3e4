// Packs folders as the program does, for bench.py to measure: pack_bench ARCHIVE [FOLDER...]
// Without a folder it makes an empty archive: the cost of the process alone. Exit status 0 when the archive was made.
#include <cstdio>
#include <string>
#include <vector>

#include "stutil/zip.h"
#include "tests/bench/peak_memory.h"

int wmain(int count, wchar_t** arguments) {
  if (count < 2) {
    std::fputs("usage: pack_bench ARCHIVE [FOLDER...]\n", stderr);
    return 2;
  }
  const std::vector<std::wstring> folders(arguments + 2, arguments + count);
  const bool isPacked = stutil::CompressWithSizeLimit_MostRecentFirst(folders, arguments[1]);
  PrintPeakMemory();
  return isPacked ? 0 : 1;
}
