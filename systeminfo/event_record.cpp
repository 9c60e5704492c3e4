#include "systeminfo/event_record.h"

namespace systeminfo {
namespace {

// EVENTLOGRECORD. Behind the fixed part stand the source and the computer name, each zero-terminated.
constexpr size_t kLength = 0;
constexpr size_t kTimeGenerated = 12;
constexpr size_t kEventId = 20;
constexpr size_t kEventType = 24;
constexpr size_t kStringCount = 26;
constexpr size_t kStringOffset = 36;
constexpr size_t kFixedSize = 56;

// `offset` and the bytes behind it must lie in `bytes`.
uint16_t Get16(std::string_view bytes, size_t offset) {
  return static_cast<uint16_t>(static_cast<unsigned char>(bytes[offset]) | static_cast<unsigned char>(bytes[offset + 1])
                                                                               << 8);
}
uint32_t Get32(std::string_view bytes, size_t offset) {
  return Get16(bytes, offset) | uint32_t{Get16(bytes, offset + 2)} << 16;
}

void AppendUtf8(std::string& utf8, uint32_t codepoint) {
  const auto put = [&utf8](uint32_t byte) { utf8 += static_cast<char>(byte); };
  if (codepoint < 0x80) {
    put(codepoint);
  } else if (codepoint < 0x800) {
    put(0xC0 | codepoint >> 6);
    put(0x80 | (codepoint & 0x3F));
  } else if (codepoint < 0x10000) {
    put(0xE0 | codepoint >> 12);
    put(0x80 | (codepoint >> 6 & 0x3F));
    put(0x80 | (codepoint & 0x3F));
  } else {
    put(0xF0 | codepoint >> 18);
    put(0x80 | (codepoint >> 12 & 0x3F));
    put(0x80 | (codepoint >> 6 & 0x3F));
    put(0x80 | (codepoint & 0x3F));
  }
}

// Half a surrogate pair becomes U+FFFD.
std::string Utf8(std::string_view utf16) {
  // Most texts are ASCII from end to end; the general loop takes over where one is not.
  std::string utf8(utf16.size() / 2, '\0');
  size_t position = 0;
  for (char& c : utf8) {
    const uint16_t unit = Get16(utf16, position);
    if (unit >= 0x80) break;
    c = static_cast<char>(unit);
    position += 2;
  }
  utf8.resize(position / 2);
  for (; position < utf16.size(); position += 2) {
    uint32_t codepoint = Get16(utf16, position);
    const bool isHigh = (codepoint & 0xFC00) == 0xD800;
    const uint16_t next = isHigh && position + 4 <= utf16.size() ? Get16(utf16, position + 2) : 0;
    if ((next & 0xFC00) == 0xDC00) {
      codepoint = 0x10000 + ((codepoint & 0x3FF) << 10 | (next & 0x3FF));
      position += 2;
    } else if ((codepoint & 0xF800) == 0xD800) {
      codepoint = 0xFFFD;
    }
    AppendUtf8(utf8, codepoint);
  }
  return utf8;
}

// Takes a zero-terminated UTF-16 text at `position`, which moves behind it. False, and nothing taken, when the record
// ends before the text does.
bool TakeText(std::string_view record, size_t& position, std::string& utf8) {
  size_t end = position;
  while (end + 2 <= record.size() && Get16(record, end) != 0)
    end += 2;
  if (end + 2 > record.size()) return false;
  utf8 = Utf8(record.substr(position, end - position));
  position = end + 2;
  return true;
}

// Returns what is wrong with the record, null when nothing is. `bytes` holds the fixed part at least.
const char* ReadRecord(std::string_view bytes, EventRecord& record) {
  record.timeGenerated = Get32(bytes, kTimeGenerated);
  record.eventId = Get32(bytes, kEventId);
  record.eventType = Get16(bytes, kEventType);
  record.sourceName.clear();
  record.computerName.clear();
  record.insertionStrings.clear();

  size_t position = kFixedSize;
  if (!TakeText(bytes, position, record.sourceName)) return "its source name does not end";
  if (!TakeText(bytes, position, record.computerName)) return "its computer name does not end";
  position = Get32(bytes, kStringOffset);
  for (size_t count = Get16(bytes, kStringCount); count > 0; --count) {
    std::string text;
    if (!TakeText(bytes, position, text)) return "its insertion strings lead out of it";
    record.insertionStrings.push_back(std::move(text));
  }
  return nullptr;
}

}  // namespace

bool EventRecordReader::Next(EventRecord& record) {
  m_offset = m_next;
  m_damage = nullptr;
  const std::string_view rest = m_buffer.substr(m_offset);
  if (rest.empty()) return false;
  m_next = m_buffer.size();
  if (rest.size() < kFixedSize) {
    m_damage = "the buffer ends within it";
    return false;
  }
  const size_t length = Get32(rest, kLength);
  if (length < kFixedSize || length > rest.size()) {
    m_damage = "its length is not possible";
    return false;
  }
  m_next = m_offset + length;
  m_damage = ReadRecord(rest.substr(0, length), record);
  return true;
}

bool IsTooOld(int64_t now, uint32_t timeGenerated) {
  constexpr int64_t kLongestAge = int64_t{30} * 24 * 60 * 60;
  return now - timeGenerated > kLongestAge;
}

}  // namespace systeminfo
