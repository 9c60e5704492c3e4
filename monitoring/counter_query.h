// The narrow seam before the system's performance counters: what a PerformanceCounter asks of them. Numbers returned
// are the system's status codes, 0 for success.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>

namespace st::monitoring {

// One query that holds one counter; the system's query lives as long as the object. Several threads may collect and
// read at the same time.
class CounterQuery {
 public:
  virtual ~CounterQuery() = default;
  virtual int32_t Open() = 0;                                // first
  virtual int32_t AddCounter(const std::wstring& path) = 0;  // second
  virtual int32_t Collect() = 0;                             // takes a sample
  virtual int32_t GetValue(double& value) = 0;               // of the last samples; rates need two
};

using CounterQueryMaker = std::function<std::unique_ptr<CounterQuery>()>;

// A query on the live counters of this machine.
std::unique_ptr<CounterQuery> MakePdhQuery();

}  // namespace st::monitoring
