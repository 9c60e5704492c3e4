// Reads the records of a buffer as the event log service fills it (EVENTLOGRECORD: little-endian, one behind the other,
// each with its length). The bytes come from outside: a length or an offset that leads out of its record ends that
// record, and nothing outside the buffer is ever looked at. Includes no Windows header.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace systeminfo {

// Text is UTF-8; what is no character in the record is U+FFFD.
struct EventRecord {
  uint32_t timeGenerated = 0;  // seconds since 1970, UTC
  uint32_t eventId = 0;        // all 32 bits, which a message table goes by
  uint16_t eventType = 0;
  std::string sourceName;
  std::string computerName;
  std::vector<std::string> insertionStrings;
};

class EventRecordReader {
 public:
  explicit EventRecordReader(std::string_view buffer) : m_buffer(buffer) {}  // the bytes must stay

  // Fills `record` with the next one, or with as much of it as is sound. False at the end of the buffer, and where a
  // record's length is unusable: what follows cannot be found then.
  bool Next(EventRecord& record);

  // What was wrong with the record of the last call; null when nothing was. And where in the buffer it begins.
  const char* Damage() const { return m_damage; }
  size_t Offset() const { return m_offset; }

 private:
  std::string_view m_buffer;
  size_t m_offset = 0;
  size_t m_next = 0;
  const char* m_damage = nullptr;
};

// Only the last 30 days are of interest. Both times in seconds since 1970.
bool IsTooOld(int64_t now, uint32_t timeGenerated);

}  // namespace systeminfo
