// Describes the programs and libraries below a folder as the product information collector does, for bench.py to
// measure: product_files_bench FOLDER. Prints how many there were. Exit status 0 when each had a digest and a version.
#include <cstdio>

#include "systeminfo/product_files.h"
#include "tests/bench/measure.h"

int wmain(int count, wchar_t** arguments) {
  if (count != 2) {
    std::fputs("usage: product_files_bench FOLDER\n", stderr);
    return 2;
  }
  const Json::Value records = Measure([&] { return systeminfo::GetProductFileInformation(arguments[1]); });
  for (const Json::Value& record : records) {
    if (record["md5"] == "" || record["version"] == "") return 1;
  }
  std::printf("records=%u\n", records.size());
  return records.empty() ? 1 : 0;
}
