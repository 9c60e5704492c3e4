// How a log line looks, how scopes indent it, and what log files are called: rules over plain data, no Windows header.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace logfile {

struct LocalTime {
  unsigned year, month, day, hour, minute, second, millisecond;
};

struct Line {
  LocalTime time;
  uint32_t level;
  uint32_t processId;
  uint32_t threadId;
  std::string_view module;  // UTF-8, as are the next two
  std::string_view function;
  std::string_view text;
  unsigned depth = 0;  // of the scopes around it
};

// One record, ended by CR LF:
//   2026-03-01 07:08:09.012 ERROR    4711:815 support_tool.exe [st::CollectData]   text
// Line breaks within the text begin a continuation line ("    | " and the rest), those at its end are dropped; any
// other control character but the tab is written as \xNN. So a line that begins with a digit begins a record, whatever
// the text.
std::string FormatLine(const Line& line);

inline constexpr unsigned kIndentWidth = 2;
inline constexpr unsigned kMostIndents = 32;             // deeper scopes are not indented further
inline constexpr size_t kLongestText = size_t{1} << 20;  // bytes; more is cut, and the record says so

// The level to file a record under: the gravest of its known bits, LOG_LEVEL_TRACE when there is none.
uint32_t EffectiveLevel(uint32_t level);

// A thread's scopes. The depth never falls below zero, whatever steps come.
struct Indent {
  unsigned ofLine;  // at which the line of this step is written: an entry and its exit stand in one column
  unsigned after;   // for the thread's next line
};
Indent ApplyStep(unsigned depth, int step);

// "<program>[-<slot>][.<module>][.<number>].log". The first slot and the file that is written now (number 0) are not
// named; `module` is empty for the program's own lines. A module with a bare number for a name is called
// "module<number>".
std::wstring LogFileName(std::wstring_view program, unsigned slot, std::wstring_view module, unsigned number);

// The renamings that make room for a new current file, to be done in this order: numbers of old files, 0 the current
// one, 1 the newest. `taken[n-1]` says whether old file n is there; its length is how many are kept. The first free
// number ends the moving; when none is free the oldest file is replaced. Nothing when no old file is kept.
struct Renaming {
  unsigned from, to;
  bool operator==(const Renaming&) const = default;
};
std::vector<Renaming> PlanRotation(const std::vector<bool>& taken);

// Whether a file of `size` bytes has no room for `more`. A file always takes its first record.
bool IsFull(uint64_t size, uint64_t more, uint64_t maxBytes);

}  // namespace logfile
