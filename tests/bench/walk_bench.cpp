// walk_bench FOLDER: the time of a whole WalkDir against a bare enumeration of the same tree, in interleaved rounds.
// Prints the medians and their ratio in one line.
#include <windows.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <string>
#include <string_view>
#include <vector>

#include "core/scoped.h"
#include "core/walk_dir.h"

namespace {

// What anyone would write first: recursive, by the functions of the system's first example.
size_t BareWalk(const std::wstring& folder) {
  WIN32_FIND_DATAW entry;
  const FindHandle listing(FindFirstFileW((folder + L"\\*").c_str(), &entry));
  if (!listing) return 0;
  size_t count = 0;
  do {
    const std::wstring_view name = entry.cFileName;
    if (name == L"." || name == L"..") continue;
    ++count;
    if ((entry.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) {
      count += BareWalk(folder + L"\\" + entry.cFileName);  // NOLINT(misc-no-recursion): a benchmark's shallow tree
    }
  } while (FindNextFileW(listing.Get(), &entry));
  return count;
}

size_t CountingWalk(const std::wstring& folder) {
  size_t count = 0;
  WalkDir(folder, [&count](const qx::PathString&, const WIN32_FIND_DATAW&) {
    ++count;
    return kWalkContinue;
  });
  return count;
}

template <class Walk>
double Milliseconds(Walk walk, const std::wstring& folder, size_t& count) {
  const auto begin = std::chrono::steady_clock::now();
  count = walk(folder);
  return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - begin).count();
}

double Median(std::vector<double> values) {
  std::sort(values.begin(), values.end());
  return values[values.size() / 2];
}

}  // namespace

int wmain(int argumentCount, wchar_t** arguments) {
  if (argumentCount != 2) {
    std::fputs("usage: walk_bench FOLDER\n", stderr);
    return 2;
  }
  constexpr int kRounds = 15;
  const std::wstring folder = arguments[1];
  std::vector<double> walkTimes;
  std::vector<double> bareTimes;
  size_t walkCount = 0;
  size_t bareCount = 0;
  for (int round = -1; round < kRounds; ++round) {  // the first round only warms the caches
    const double walkTime = Milliseconds(CountingWalk, folder, walkCount);
    const double bareTime = Milliseconds(BareWalk, folder, bareCount);
    if (walkCount != bareCount || walkCount == 0) {
      std::fprintf(stderr, "the walks saw %zu and %zu entries\n", walkCount, bareCount);
      return 1;
    }
    if (round < 0) continue;
    walkTimes.push_back(walkTime);
    bareTimes.push_back(bareTime);
  }
  const double walk = Median(walkTimes);
  const double bare = Median(bareTimes);
  std::printf("walk_dir ms=%.2f bare ms=%.2f ratio=%.2f\n", walk, bare, walk / bare);
  return 0;
}
