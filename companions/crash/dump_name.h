// How crash dumps are named, and which of them go when there are too many. No Windows here.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace crash {

struct DumpTime {  // UTC
  uint16_t year, month, day, hour, minute, second;
};

// The path of a dump, "<folder>\<program>_<process id>_<yyyymmdd>-<hhmmss>.dmp", and of the file that it is written to
// before. Everything but the time is laid out beforehand, so that a spoilt heap is no obstacle.
class DumpPath {
 public:
  // `program` is the file name of the executable; `kind` is put behind it.
  DumpPath(std::wstring_view folder, std::wstring_view program, uint32_t processId, std::wstring_view kind = {});

  void SetTime(const DumpTime& time) noexcept;  // allocates nothing

  const wchar_t* Path() const { return m_path.c_str(); }
  const wchar_t* PartialPath() const { return m_partial.c_str(); }

 private:
  size_t m_timeOffset;
  std::wstring m_path;
  std::wstring m_partial;
};

// Whether a file name is one that DumpPath makes, for any program. Nothing else in the folder is ever deleted.
bool IsDumpName(std::wstring_view name);
bool IsPartialDumpName(std::wstring_view name);

struct DumpFile {
  std::wstring name;
  uint64_t time = 0;  // of the last write; any unit
};

// Oldest first; files of one time by name.
void SortByAge(std::vector<DumpFile>& dumps);

}  // namespace crash
