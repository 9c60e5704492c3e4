// handles_bench HANDLES PROCESSES: groups a table of handles by process and asks for each process's, against one scan
// of the table for each process; in interleaved rounds, for the table as the kernel gives it (each process's handles in
// a row) and for one in no order. Prints the medians and their ratio, one line for each table.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <cwchar>
#include <random>
#include <string>
#include <vector>

#include "systeminfo/handle_table.h"

namespace {

constexpr size_t kEntriesOffset = systeminfo::HandleTable::kEntriesOffset;
constexpr size_t kEntrySize = systeminfo::HandleTable::kEntrySize;

std::string MakeTable(uint32_t handles, uint32_t processes, bool isOrdered) {
  std::string bytes(kEntriesOffset + handles * kEntrySize, '\0');
  std::memcpy(bytes.data(), &handles, sizeof handles);
  std::vector<uint32_t> owners(handles);
  for (uint32_t i = 0; i < handles; ++i)
    owners[i] = i % processes * 4 + 4;
  std::mt19937 random(1);
  if (isOrdered) {
    std::sort(owners.begin(), owners.end());
  } else {
    std::shuffle(owners.begin(), owners.end(), random);
  }
  for (uint32_t i = 0; i < handles; ++i) {
    const auto value = static_cast<uint16_t>(i * 4);
    char* const entry = bytes.data() + kEntriesOffset + i * kEntrySize;
    std::memcpy(entry, &owners[i], sizeof owners[i]);
    std::memcpy(entry + 6, &value, sizeof value);
  }
  return bytes;
}

// The sum of all values keeps the compiler from leaving anything out, and shows that both ways found the same.
uint64_t Grouped(const std::string& table, uint32_t processes) {
  const systeminfo::HandleTable grouped(table);
  uint64_t sum = 0;
  for (uint32_t i = 0; i < processes; ++i) {
    for (const uint16_t value : grouped.HandlesOf(i * 4 + 4))
      sum += value;
  }
  return sum;
}

uint64_t Scanned(const std::string& table, uint32_t processes) {
  uint32_t handles = 0;
  std::memcpy(&handles, table.data(), sizeof handles);
  uint64_t sum = 0;
  for (uint32_t i = 0; i < processes; ++i) {
    for (uint32_t entry = 0; entry < handles; ++entry) {
      uint32_t owner = 0;
      uint16_t value = 0;
      std::memcpy(&owner, table.data() + kEntriesOffset + entry * kEntrySize, sizeof owner);
      std::memcpy(&value, table.data() + kEntriesOffset + entry * kEntrySize + 6, sizeof value);
      if (owner == i * 4 + 4) sum += value;
    }
  }
  return sum;
}

template <class Way>
double Milliseconds(Way way, const std::string& table, uint32_t processes, uint64_t& sum) {
  const auto begin = std::chrono::steady_clock::now();
  sum = way(table, processes);
  return std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - begin).count();
}

double Median(std::vector<double> values) {
  std::sort(values.begin(), values.end());
  return values[values.size() / 2];
}

bool Compare(const char* name, const std::string& table, uint32_t processes) {
  constexpr int kRounds = 7;
  std::vector<double> groupedTimes;
  std::vector<double> scannedTimes;
  for (int round = 0; round < kRounds; ++round) {
    uint64_t grouped = 0;
    uint64_t scanned = 0;
    groupedTimes.push_back(Milliseconds(Grouped, table, processes, grouped));
    scannedTimes.push_back(Milliseconds(Scanned, table, processes, scanned));
    if (grouped != scanned) {
      std::fprintf(stderr, "the two ways found different handles\n");
      return false;
    }
  }
  const double grouped = Median(groupedTimes);
  const double scanned = Median(scannedTimes);
  std::printf("%s: grouped ms=%.2f scanned ms=%.2f ratio=%.4f\n", name, grouped, scanned, grouped / scanned);
  return true;
}

}  // namespace

int wmain(int argumentCount, wchar_t** arguments) {
  if (argumentCount != 3) {
    std::fputs("usage: handles_bench HANDLES PROCESSES\n", stderr);
    return 2;
  }
  const auto handles = static_cast<uint32_t>(std::wcstoul(arguments[1], nullptr, 10));
  const auto processes = static_cast<uint32_t>(std::max(1UL, std::wcstoul(arguments[2], nullptr, 10)));
  const bool isGood = Compare("in a row", MakeTable(handles, processes, true), processes) &&
                      Compare("in no order", MakeTable(handles, processes, false), processes);
  return isGood ? 0 : 1;
}
