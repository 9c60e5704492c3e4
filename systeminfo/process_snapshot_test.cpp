#include "systeminfo/process_snapshot.h"

#include <gmock/gmock.h>

#include <algorithm>

#include "core/logging.h"
#include "core/program_path.h"
#include "tests/support/process_child.h"

namespace systeminfo {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

TEST(ProcessSnapshot, RunningProcessesAreFoundByIdAndByAPieceOfTheirPath) {
  const ProcessChild one;
  const ProcessChild other;
  ProcessInfoCache cache;
  cache.TakeProceessesSnapshot();
  EXPECT_EQ(cache.GetProcessDataByPid(one.processId), ProcessChild::Path());
  EXPECT_EQ(cache.GetProcessDataByPid(GetCurrentProcessId()), ProgramPath());

  std::vector<DWORD> ids;
  for (const auto& [id, process] : cache.GetProcessesByName(L"\\process_child.ex")) {
    EXPECT_EQ(GetProcessId(process), id);
    ids.push_back(id);
  }
  EXPECT_TRUE(std::is_sorted(ids.begin(), ids.end()));
  EXPECT_THAT(ids, testing::IsSupersetOf({one.processId, other.processId}));
  EXPECT_THAT(cache.GetProcessesByName(L"\\Process_child.ex"), IsEmpty()) << "the case counts";
  // Everything but what has no path.
  EXPECT_EQ(cache.GetProcessesByName(L"").size(),
            static_cast<size_t>(std::count_if(cache.Records().begin(), cache.Records().end(),
                                              [](const auto& record) { return !record.imagePath.empty(); })));
}

TEST(ProcessSnapshot, HandlesStayOpenWhenTheProcessEnds) {
  ProcessChild child;
  ProcessInfoCache cache;
  cache.TakeProceessesSnapshot();
  child.Kill();
  const auto found = cache.GetProcessesByName(L"process_child");
  const auto record =
      std::find_if(found.begin(), found.end(), [&](const auto& process) { return process.first == child.processId; });
  ASSERT_NE(record, found.end());
  DWORD code = 0;
  EXPECT_TRUE(GetExitCodeProcess(record->second, &code));
  EXPECT_EQ(code, 1u);
}

TEST(ProcessSnapshot, WhatIsNotThereIsEmptyAndLogged) {
  const ProcessInfoCache cache;
  logging::ErrorCapture capture(logging::Level::kTrace);
  EXPECT_EQ(cache.GetProcessDataByPid(12345), L"");
  EXPECT_EQ(ProcessInfoCache::GetProcessName(INVALID_HANDLE_VALUE), L"");
  EXPECT_EQ(ProcessInfoCache::GetProcessName(nullptr), L"");
  EXPECT_THAT(cache.GetProcessesByName(L""), IsEmpty());
  EXPECT_THAT(
      capture.Take(),
      ElementsAre(L"systeminfo::ProcessInfoCache::GetProcessDataByPid: Could not find valid process data for pid 12345",
                  L"systeminfo::ProcessInfoCache::GetProcessName: Invalid process handle",
                  L"systeminfo::ProcessInfoCache::GetProcessName: QueryFullProcessImageName failed with error code : "
                  L"6"));
}

}  // namespace
}  // namespace systeminfo
