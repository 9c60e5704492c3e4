#include "systeminfo/handle_table.h"

#include <algorithm>
#include <array>
#include <cstring>

namespace systeminfo {
namespace {

// The systems that the program is for are all little-endian.
template <class Number>
Number NumberAt(std::string_view bytes, size_t offset) {
  Number number;
  std::memcpy(&number, bytes.data() + offset, sizeof number);
  return number;
}

}  // namespace

HandleTable::HandleTable(std::string_view reply) {
  if (reply.size() < kEntriesOffset) return;
  const size_t claimed = NumberAt<uint32_t>(reply, 0);
  const size_t count = std::min(claimed, (reply.size() - kEntriesOffset) / kEntrySize);
  m_missing = claimed - count;
  const std::string_view entries = reply.substr(kEntriesOffset, count * kEntrySize);

  // Half a million entries belong to a few hundred processes, so nearly all of them are found here. Process ids are
  // multiples of four.
  struct Found {
    uint32_t owner = 0;
    Group* group = nullptr;
  };
  std::array<Found, 1024> lately;
  const auto groupOf = [&](uint32_t owner) -> Group& {
    Found& found = lately[owner / 4 % lately.size()];
    if (found.group == nullptr || found.owner != owner) found = {owner, &m_groups[owner]};
    return *found.group;
  };
  for (size_t at = 0; at < entries.size(); at += kEntrySize)
    ++groupOf(NumberAt<uint32_t>(entries, at)).count;
  uint32_t end = 0;
  for (auto& [owner, counted] : m_groups) {
    counted.end = end;  // moves on with each value, up to the real end
    end += counted.count;
  }
  m_values.resize(count);
  for (size_t at = 0; at < entries.size(); at += kEntrySize)
    m_values[groupOf(NumberAt<uint32_t>(entries, at)).end++] = NumberAt<uint16_t>(entries, at + 6);
}

std::span<const uint16_t> HandleTable::HandlesOf(uint32_t processId) const {
  const auto found = m_groups.find(processId);
  if (found == m_groups.end()) return {};
  const Group& group = found->second;
  return std::span(m_values).subspan(group.end - group.count, group.count);
}

std::optional<std::u16string> LeadingCountedString(std::string_view reply, uint64_t replyAddress) {
  constexpr size_t kHeaderSize = 16;
  if (reply.size() < kHeaderSize) return std::nullopt;
  const size_t length = NumberAt<uint16_t>(reply, 0);
  const uint64_t address = NumberAt<uint64_t>(reply, 8);
  if (length == 0) return std::u16string();
  if (address < replyAddress || address - replyAddress > reply.size()) return std::nullopt;
  const auto offset = static_cast<size_t>(address - replyAddress);
  if (length > reply.size() - offset) return std::nullopt;
  std::u16string text(length / sizeof(char16_t), u'\0');
  std::memcpy(text.data(), reply.data() + offset, text.size() * sizeof(char16_t));
  return text;
}

}  // namespace systeminfo
