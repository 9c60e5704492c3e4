// Reads two replies of the kernel: the table of all open handles of the system (SystemHandleInformation), grouped by
// process, and the name in the description of an object's type. Pure; a count, length or address that leaves the bytes
// is never followed.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace systeminfo {

// The layout of 64-bit Windows: a 32-bit count, then entries from byte 8 on. Of an entry the owner (32 bits, at 0) and
// the handle value (16 bits, at 6) are read.
class HandleTable {
 public:
  static constexpr size_t kEntriesOffset = 8;
  static constexpr size_t kEntrySize = 24;

  HandleTable() = default;
  explicit HandleTable(std::string_view reply);

  // The handle values of a process, in the order of the table. Valid as long as the object.
  std::span<const uint16_t> HandlesOf(uint32_t processId) const;

  size_t MissingEntries() const { return m_missing; }  // counted by the reply, but not in its bytes

 private:
  struct Group {
    uint32_t end = 0;  // in m_values, behind the last one
    uint32_t count = 0;
  };

  std::vector<uint16_t> m_values;  // the processes one after another
  std::unordered_map<uint32_t, Group> m_groups;
  size_t m_missing = 0;
};

// The counted string (16-bit length in bytes, 64-bit address of the characters at 8) that a reply begins with.
// `replyAddress` is where the reply stood when the kernel wrote it: the characters must lie in it too.
std::optional<std::u16string> LeadingCountedString(std::string_view reply, uint64_t replyAddress);

}  // namespace systeminfo
