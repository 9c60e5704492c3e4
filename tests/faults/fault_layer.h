// Counts the calls of the table and says which of them is to fail. A library of its own, because the program and its
// run-time libraries, each built with the calls of fault_calls.cpp, have to count together. Nothing is counted and
// nothing fails but between BeginFaults and EndFaults. Any thread may call.
#pragma once

#include "tests/faults/fault_table.h"

#ifdef ST_FAULT_LAYER_EXPORTS
#define ST_FAULT_API __declspec(dllexport)
#else
#define ST_FAULT_API __declspec(dllimport)
#endif

namespace faults {

struct Fault {
  size_t row = kCallCount;  // kCallCount: calls are only counted
  uint32_t call = 1;        // the n-th call of the row fails, and only that one
  uint32_t error = 0;
};

extern "C" {

// For whoever walks. The counts begin at 0.
ST_FAULT_API void BeginFaults(const Fault* fault);
ST_FAULT_API void EndFaults();
ST_FAULT_API uint32_t CountOfCalls(size_t row);
ST_FAULT_API bool FaultHasStruck();

// For the calls: counts this one. The error with which it is to fail, or 0.
ST_FAULT_API uint32_t ErrorOfCall(size_t row);
// The system's own function.
ST_FAULT_API void* RealCall(size_t row);
}

}  // namespace faults
