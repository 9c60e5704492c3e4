// Zip archives as nobody's library would write them: any name, any attributes, sizes that lie.
#pragma once

#include <miniz.h>

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

struct CraftedEntry {
  std::string name;
  std::string content;
  uint32_t attributes = 0;  // the upper half is the mode on Unix
  std::optional<uint32_t> claimedSize =
      std::nullopt;  // uncompressed, in place of the true one; the entry is deflated then, else stored
  std::optional<uint32_t> claimedCrc = std::nullopt;
};

template <std::unsigned_integral Number>
void AppendLittleEndian(std::string& bytes, Number number) {
  for (size_t i = 0; i < sizeof number; ++i)
    bytes += static_cast<char>(static_cast<uint64_t>(number) >> (8 * i) & 0xFF);
}

// A raw deflate stream that repeats the content as it is.
inline std::string DeflateWithoutGain(const std::string& content) {
  constexpr size_t kMostInBlock = 0xFFFF;
  std::string stream;
  for (size_t begin = 0; begin < content.size(); begin += kMostInBlock) {
    const std::string block = content.substr(begin, kMostInBlock);
    stream += begin + block.size() == content.size() ? '\1' : '\0';  // the last block says so
    AppendLittleEndian(stream, static_cast<uint16_t>(block.size()));
    AppendLittleEndian(stream, static_cast<uint16_t>(~block.size()));
    stream += block;
  }
  return stream;
}

inline std::string PackedContent(const CraftedEntry& entry) {
  return entry.claimedSize ? DeflateWithoutGain(entry.content) : entry.content;
}

// What the local header and the directory's record have in common: from "version needed" to the length of the name.
inline void AppendCommonFields(std::string& bytes, const CraftedEntry& entry) {
  const auto* const data = reinterpret_cast<const unsigned char*>(entry.content.data());
  const auto crc = static_cast<uint32_t>(mz_crc32(MZ_CRC32_INIT, data, entry.content.size()));
  const int method = entry.claimedSize ? MZ_DEFLATED : 0;
  for (const int field : {20, 0, method, 0, 0x21})  // version, flags, method, time, date
    AppendLittleEndian(bytes, static_cast<uint16_t>(field));
  AppendLittleEndian(bytes, entry.claimedCrc.value_or(crc));
  AppendLittleEndian(bytes, static_cast<uint32_t>(PackedContent(entry).size()));
  AppendLittleEndian(bytes, entry.claimedSize.value_or(static_cast<uint32_t>(entry.content.size())));
  AppendLittleEndian(bytes, static_cast<uint16_t>(entry.name.size()));
  AppendLittleEndian(bytes, uint16_t{0});  // extra field
}

inline std::string CraftZip(const std::vector<CraftedEntry>& entries) {
  std::string bytes;
  std::string directory;
  for (const CraftedEntry& entry : entries) {
    const auto offset = static_cast<uint32_t>(bytes.size());
    bytes += "PK\x03\x04";
    AppendCommonFields(bytes, entry);
    bytes += entry.name + PackedContent(entry);

    directory += "PK\x01\x02";
    AppendLittleEndian(directory, uint16_t{20});
    AppendCommonFields(directory, entry);
    for (int i = 0; i < 3; ++i)  // comment, disk, internal attributes
      AppendLittleEndian(directory, uint16_t{0});
    AppendLittleEndian(directory, entry.attributes);
    AppendLittleEndian(directory, offset);
    directory += entry.name;
  }
  const auto offset = static_cast<uint32_t>(bytes.size());
  bytes += directory + "PK\x05\x06";
  AppendLittleEndian(bytes, uint32_t{0});  // disks
  AppendLittleEndian(bytes, static_cast<uint16_t>(entries.size()));
  AppendLittleEndian(bytes, static_cast<uint16_t>(entries.size()));
  AppendLittleEndian(bytes, static_cast<uint32_t>(directory.size()));
  AppendLittleEndian(bytes, offset);
  AppendLittleEndian(bytes, uint16_t{0});  // comment
  return bytes;
}
