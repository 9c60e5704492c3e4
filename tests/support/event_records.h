// Buffers of event records as the event log service fills them.
#pragma once

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

namespace event_records {

struct Fields {
  uint32_t timeGenerated = 0;
  uint32_t eventId = 0;
  uint16_t eventType = 4;
  std::u16string source = u"Source";
  std::u16string computer = u"COMPUTER";
  std::vector<std::u16string> strings = {};
};

// Where the fields of a record stand that tests damage.
inline constexpr size_t kLength = 0, kStringCount = 26, kStringOffset = 36, kFixedSize = 56;

template <class Number>
void Put(std::string& bytes, size_t offset, Number number) {
  std::memcpy(bytes.data() + offset, &number, sizeof number);
}

// The bytes of one record: the fixed part, the names, an account identifier, the strings, four bytes of data, and the
// length once more.
inline std::string Make(const Fields& fields) {
  std::string bytes(kFixedSize, '\0');
  const auto append = [&bytes](const std::u16string& text) {
    bytes.append(reinterpret_cast<const char*>(text.c_str()), (text.size() + 1) * sizeof(char16_t));
  };
  const auto here = [&bytes] { return static_cast<uint32_t>(bytes.size()); };
  append(fields.source);
  append(fields.computer);
  bytes.resize((bytes.size() + 3) / 4 * 4);
  Put(bytes, 40, uint32_t{12});
  Put(bytes, 44, here());
  bytes += std::string("\1\1\0\0\0\0\0\5\22\0\0\0", 12);
  Put(bytes, kStringOffset, here());
  for (const std::u16string& text : fields.strings)
    append(text);
  Put(bytes, 48, uint32_t{4});
  Put(bytes, 52, here());
  bytes += "data";
  bytes.resize((bytes.size() + 3) / 4 * 4 + 4);
  Put(bytes, bytes.size() - 4, here());

  Put(bytes, kLength, here());
  Put(bytes, 4, uint32_t{0x654C664C});
  Put(bytes, 12, fields.timeGenerated);
  Put(bytes, 16, fields.timeGenerated);
  Put(bytes, 20, fields.eventId);
  Put(bytes, 24, fields.eventType);
  Put(bytes, kStringCount, static_cast<uint16_t>(fields.strings.size()));
  return bytes;
}

}  // namespace event_records
