// Packs folders as the program does, for bench.py to measure: pack_bench ARCHIVE [FOLDER...]
// Without a folder it makes an empty archive: the cost of the process alone. Exit status 0 when the archive was made.
#include <windows.h>

#include <shellapi.h>

#include <cstdio>
#include <string>
#include <vector>

#include "core/scoped.h"
#include "stutil/zip.h"

int main() {
  int count = 0;
  const LocalMemory<wchar_t*> arguments(CommandLineToArgvW(GetCommandLineW(), &count));
  if (!arguments || count < 2) {
    std::fputs("usage: pack_bench ARCHIVE [FOLDER...]\n", stderr);
    return 2;
  }
  const std::vector<std::wstring> folders(arguments.Get() + 2, arguments.Get() + count);
  return stutil::CompressWithSizeLimit_MostRecentFirst(folders, arguments.Get()[1]) ? 0 : 1;
}
