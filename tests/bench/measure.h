// What a benchmark program says of itself when its job is done.
#pragma once

#include <windows.h>

#include <psapi.h>

#include <chrono>
#include <cstdio>

// Runs the job and prints "seconds=<of the job> peak_memory=<bytes, the most that this process ever had in memory>".
template <class Job>
auto Measure(Job job) {
  const auto begin = std::chrono::steady_clock::now();
  auto result = job();
  const std::chrono::duration<double> seconds = std::chrono::steady_clock::now() - begin;
  PROCESS_MEMORY_COUNTERS counters{};
  K32GetProcessMemoryInfo(GetCurrentProcess(), &counters, sizeof counters);
  std::printf("seconds=%.4f peak_memory=%llu\n", seconds.count(),
              static_cast<unsigned long long>(counters.PeakWorkingSetSize));
  return result;
}
