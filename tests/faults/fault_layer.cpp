#include "tests/faults/fault_layer.h"

#include <array>
#include <atomic>

namespace faults {
namespace {

std::atomic<bool> g_counts{false};
std::atomic<bool> g_hasStruck{false};
std::array<std::atomic<uint32_t>, kCallCount> g_calls;
std::array<std::atomic<void*>, kCallCount> g_real;
Fault g_fault;  // changes only while nothing counts

}  // namespace

extern "C" {

void BeginFaults(const Fault* fault) {
  g_fault = *fault;
  g_hasStruck = false;
  for (auto& count : g_calls)
    count = 0;
  g_counts = true;
}

void EndFaults() {
  g_counts = false;
}

uint32_t CountOfCalls(size_t row) {
  return g_calls[row];
}

bool FaultHasStruck() {
  return g_hasStruck;
}

uint32_t ErrorOfCall(size_t row) {
  if (!g_counts) return 0;
  const uint32_t call = ++g_calls[row];
  if (row != g_fault.row || call != g_fault.call) return 0;
  g_hasStruck = true;
  return g_fault.error;
}

void* RealCall(size_t row) {
  if (void* const known = g_real[row]) return known;
  void* const found =
      reinterpret_cast<void*>(GetProcAddress(LoadLibraryA(kCalls[row].library), kCalls[row].name));  // NOLINT
  g_real[row] = found;
  return found;
}
}

}  // namespace faults
