#include "stutil/pack_plan.h"

#include <algorithm>

namespace stutil {

std::vector<PackJob> PlanJobs(std::span<const FileRecord> files) {
  std::vector<PackJob> jobs;
  PackJob run;
  uint64_t runSize = 0;
  const auto endRun = [&] {
    if (run.fileCount != 0) jobs.push_back(run);
    run = PackJob{};
    runSize = 0;
  };
  for (size_t i = 0; i < files.size(); ++i) {
    const uint64_t size = files[i].size;
    if (size > kPieceSize) {
      endRun();
      for (uint64_t offset = 0; offset < size; offset += kPieceSize) {
        const uint64_t length = std::min(kPieceSize, size - offset);
        jobs.push_back({i, 1, offset, length, true, offset + length == size});
      }
      continue;
    }
    if (run.fileCount == kRunFiles || runSize + size > kRunSize) endRun();
    if (run.fileCount == 0) run.firstFile = i;
    ++run.fileCount;
    runSize += size;
  }
  endRun();
  return jobs;
}

}  // namespace stutil
