// md5_bench FOLDER: hashes every file below the folder in one batch. Prints the time, then "<digest>  <path>" for each.
#include <windows.h>

#include <string_view>

#include "core/text.h"
#include "core/walk_dir.h"
#include "systeminfo/utils/file_md5.h"
#include "tests/bench/measure.h"

int wmain(int argumentCount, wchar_t** arguments) {
  if (argumentCount != 2) {
    std::fputs("usage: md5_bench FOLDER\n", stderr);
    return 2;
  }
  std::vector<std::string> paths;
  WalkDir(arguments[1], [&paths](const qx::PathString& path, uint32_t attributes) {
    if ((attributes & FILE_ATTRIBUTE_DIRECTORY) == 0) paths.push_back(ToUtf8(path));
    return kWalkContinue;
  });
  const std::vector<std::string> digests = Measure([&paths] { return systeminfo::utils::GetFileMD5s(paths); });
  for (size_t i = 0; i < paths.size(); ++i)
    std::printf("%s  %s\n", digests[i].c_str(), paths[i].c_str());
  return 0;
}
