// Replaces a file by its package, as the program does after zipping.
// usage: encrypt_bench FILE
#include <windows.h>

#include "core/files.h"
#include "stutil/package.h"
#include "tests/bench/measure.h"

int wmain(int argumentCount, wchar_t** arguments) {
  if (argumentCount != 2) return 2;
  const auto encrypt = [&] {
    stutil::Encrypt(arguments[1]);
    return PathExists(arguments[1]);
  };
  return Measure(encrypt) ? 0 : 1;
}
