// soak_child collect COUNT | monitor SAMPLES SECONDS
// Collects COUNT times in a row, or monitors and takes SAMPLES of itself every SECONDS seconds, all in one process and
// in the current directory. After each collection, or interval, it writes "sample <private bytes> <type>=<handles> ..."
// and waits for a line on its standard input, so that whoever started it can look at it while it rests.
#include <windows.h>
// windows.h has to come first.
#include <psapi.h>

#include <cstdio>
#include <cstdlib>
#include <map>
#include <string>
#include <thread>
#include <vector>

#include "app/collection_driver.h"
#include "core/abandoned_threads.h"
#include "core/dynamic_library.h"
#include "core/logger_config.h"
#include "core/logging.h"
#include "monitoring/monitoring_manager.h"
#include "systeminfo/handle_snapshot.h"

namespace {

// How many handles of each type are open: from the table of the whole system, which works where GetProcessHandleCount
// does not.
std::map<std::wstring, int> OpenHandles() {
  std::vector<HandleInfo> handles;
  ProcessHandlerHelper().GetHandleInformationForProcess(GetCurrentProcessId(), handles);
  std::map<std::wstring, int> counts;
  for (const HandleInfo& handle : handles)
    ++counts[handle.type];
  return counts;
}

size_t PrivateBytes() {
  PROCESS_MEMORY_COUNTERS_EX counters{};
  counters.cb = sizeof counters;
  if (!K32GetProcessMemoryInfo(GetCurrentProcess(), reinterpret_cast<PROCESS_MEMORY_COUNTERS*>(&counters),
                               sizeof counters)) {
    return 0;
  }
  return counters.PrivateUsage;
}

// False when nobody wants more.
bool ShowSample() {
  HeapCompact(GetProcessHeap(), 0);
  std::printf("sample %zu", PrivateBytes());
  for (const auto& [type, count] : OpenHandles())
    std::printf(" %ls=%d", type.c_str(), count);
  std::puts("");
  std::fflush(stdout);
  char line[16] = {};
  return std::fgets(line, sizeof line, stdin) != nullptr;
}

int Collect(int count) {
  CollectParameters parameters;
  parameters.settingsFile = L"stsettings.json";
  parameters.outputFolder = L"soak";
  const std::atomic<bool> cancel{false};
  for (int i = 0; i < count; ++i) {
    const int result = st::CollectData(
        cancel, parameters, [](int, int) {}, [](const std::wstring&) { return true; });
    if (result != st::kCollectDone) {
      std::printf("collection %d ended with %d\n", i, result);
      return 1;
    }
    if (!ShowSample()) break;
  }
  return 0;
}

int Monitor(int samples, int seconds) {
  st::monitoring::MonitoringManager manager(L"monitoring.json");
  if (!manager.Init()) return 1;
  std::thread sampler([&] {
    for (int i = 0; i < samples; ++i) {
      Sleep(static_cast<DWORD>(seconds) * 1000);
      if (!ShowSample()) break;
    }
    manager.Stop();
  });
  const bool isStarted = manager.Start();
  sampler.join();
  return isStarted ? 0 : 1;
}

}  // namespace

int wmain(int count, wchar_t** arguments) {
  RestrictLibrarySearch();
  const auto logger = logging::CLogDLL::Get();
  logging::LoggerConfig::Init();
  const std::wstring job = count > 1 ? arguments[1] : L"";
  if (job == L"collect" && count == 3) return EndingCode(Collect(_wtoi(arguments[2])));
  if (job == L"monitor" && count == 4) return EndingCode(Monitor(_wtoi(arguments[2]), _wtoi(arguments[3])));
  std::puts("usage: soak_child collect COUNT | monitor SAMPLES SECONDS");
  return 2;
}
