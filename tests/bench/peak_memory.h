// What a benchmark program says of itself when it ends.
#pragma once

#include <windows.h>

#include <psapi.h>

#include <cstdio>

// One line on the standard output: "peak_memory=<bytes>", the most that this process ever had in memory.
inline void PrintPeakMemory() {
  PROCESS_MEMORY_COUNTERS counters{};
  if (!K32GetProcessMemoryInfo(GetCurrentProcess(), &counters, sizeof counters)) return;
  std::printf("peak_memory=%llu\n", static_cast<unsigned long long>(counters.PeakWorkingSetSize));
}
