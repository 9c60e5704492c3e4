#include "companions/log/dropped_lines.h"

namespace logfile {

void DroppedLines::Write(std::string_view line, const WriteFunction& write, const NoticeFunction& notice) {
  const uint32_t error = m_count == 0 ? write(line) : write(notice(m_count, m_firstError) + std::string(line));
  if (error == 0) {
    m_count = 0;
    return;
  }
  if (m_count == 0) m_firstError = error;
  ++m_count;
}

void DroppedLines::Add(const DroppedLines& other) {
  if (m_count == 0) m_firstError = other.m_firstError;
  m_count += other.m_count;
}

}  // namespace logfile
