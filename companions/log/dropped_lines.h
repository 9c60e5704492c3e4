// What happens to a line that cannot be written (the disk is full, the folder is gone): it is dropped and counted, and
// the first line that can be written again is preceded by one that says how many are missing. Plain data; the caller
// writes.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>

namespace logfile {

class DroppedLines {
 public:
  using WriteFunction =
      std::function<uint32_t(std::string_view bytes)>;  // 0, or the error: then nothing counts as written
  using NoticeFunction = std::function<std::string(uint64_t count, uint32_t error)>;  // the whole line that tells of it

  // Writes `line`, with the notice before it in the same write when lines are missing.
  void Write(std::string_view line, const WriteFunction& write, const NoticeFunction& notice);

  // Takes over the count of a file that is given up.
  void Add(const DroppedLines& other);

 private:
  uint64_t m_count = 0;
  uint32_t m_firstError = 0;
};

}  // namespace logfile
