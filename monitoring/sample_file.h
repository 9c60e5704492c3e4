// The samples of one counter as a CSV file, so that a run can be plotted afterwards: a heading "time,value", then one
// line for each sample. The time is UTC, ISO 8601 with milliseconds; the value is the shortest text that reads back as
// the same number.
#pragma once

#include <windows.h>

#include <cstdint>
#include <mutex>
#include <string>

#include "core/scoped.h"

namespace st::monitoring {

// Any thread may append. Others may read the file meanwhile. A failure is logged once, and nothing is written after it.
class SampleFile {
 public:
  // An existing file is gone on with. It never grows beyond `mostBytes`; a line that would make it is left out with all
  // that follow.
  SampleFile(std::wstring path, uint64_t mostBytes) : m_path(std::move(path)), m_mostBytes(mostBytes) {}

  void Append(const SYSTEMTIME& utc, double value);

 private:
  bool Open();
  bool Write(const std::string& line);

  const std::wstring m_path;
  const uint64_t m_mostBytes;
  std::mutex m_mutex;
  KernelHandle m_file;  // opened for the first sample
  uint64_t m_size = 0;
  bool m_isOver = false;
};

std::string SampleLine(const SYSTEMTIME& utc, double value);

}  // namespace st::monitoring
