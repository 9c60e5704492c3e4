// Replaces a file by its package, as the program does after zipping: what is measured is the whole process.
// usage: encrypt_bench FILE
#include <windows.h>

#include "core/files.h"
#include "stutil/package.h"
#include "tests/bench/peak_memory.h"

int wmain(int argumentCount, wchar_t** arguments) {
  if (argumentCount != 2) return 2;
  stutil::Encrypt(arguments[1]);
  PrintPeakMemory();
  return PathExists(arguments[1]) ? 0 : 1;
}
