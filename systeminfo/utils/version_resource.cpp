#include "systeminfo/utils/version_resource.h"

#include <algorithm>
#include <optional>

#include "core/little_endian.h"

namespace systeminfo::utils {
namespace {

constexpr size_t kSectionHeaderSize = 40;
constexpr uint32_t kVersionType = 16;  // RT_VERSION
constexpr uint32_t kSubfolderBit = 0x80000000;

// A part of the file that is loaded to an address relative to the image's.
struct Section {
  uint32_t address = 0;
  uint32_t size = 0;
  uint32_t fileOffset = 0;
};

class PeFile {
 public:
  explicit PeFile(const ReadAt& readAt) : m_readAt(readAt) {}

  std::string FixedVersionInfo() {
    if (!FindResources()) return {};
    // Type, name, language; of names and languages the first counts.
    std::optional<uint32_t> entry = FindEntry(0, kVersionType);
    for (int level = 0; level < 2 && entry && (*entry & kSubfolderBit) != 0; ++level)
      entry = FindEntry(*entry & ~kSubfolderBit, std::nullopt);
    if (!entry || (*entry & kSubfolderBit) != 0 || !Read(uint64_t{m_resourcesOffset} + *entry, 8)) return {};
    return ReadVersionBlock(Number<uint32_t>(0), Number<uint32_t>(4));
  }

 private:
  bool Read(uint64_t offset, size_t size) { return m_readAt(offset, size, m_bytes); }

  template <class T>
  T Number(size_t offset) const {
    return ReadLittleEndian<T>(m_bytes, offset);
  }

  // Sets where the resources are in the file, and the section that they lie in.
  bool FindResources() {
    if (!Read(0, 64) || Number<uint16_t>(0) != 0x5A4D) return false;  // "MZ"
    const uint64_t header = Number<uint32_t>(60);
    constexpr size_t kHeaderSize = 24;                                              // signature and file header
    if (!Read(header, kHeaderSize) || Number<uint32_t>(0) != 0x4550) return false;  // "PE"
    const size_t sectionCount = Number<uint16_t>(6);
    const size_t optionalSize = Number<uint16_t>(20);
    if (optionalSize < 2 || !Read(header + kHeaderSize, optionalSize)) return false;
    const bool is64Bit = Number<uint16_t>(0) == 0x20B;
    const size_t resourceEntry = (is64Bit ? 112 : 96) + 2 * 8;  // the third of the data directories
    if (resourceEntry + 8 > optionalSize) return false;
    const uint32_t resources = Number<uint32_t>(resourceEntry);
    if (resources == 0 || !Read(header + kHeaderSize + optionalSize, sectionCount * kSectionHeaderSize)) return false;
    return FindSection(resources, sectionCount);
  }

  // The section with the address `resources`, by the section headers that were read last.
  bool FindSection(uint32_t resources, size_t count) {
    for (size_t i = 0; i < count; ++i) {
      const size_t at = i * kSectionHeaderSize;
      const uint32_t sizeInFile = Number<uint32_t>(at + 16);
      m_section = {Number<uint32_t>(at + 12), sizeInFile, Number<uint32_t>(at + 20)};
      if (resources < m_section.address || resources - m_section.address >= m_section.size) continue;
      m_resourcesOffset = uint64_t{m_section.fileOffset} + (resources - m_section.address);
      return true;
    }
    return false;
  }

  // What the entry `id` of the resource folder at `offset` points to: without an id, its first entry.
  std::optional<uint32_t> FindEntry(uint32_t offset, std::optional<uint32_t> id) {
    constexpr size_t kFolderSize = 16;
    constexpr size_t kEntrySize = 8;
    if (!Read(m_resourcesOffset + offset, kFolderSize)) return std::nullopt;
    const size_t count = size_t{Number<uint16_t>(12)} + Number<uint16_t>(14);  // named ones, and those with numbers
    const size_t wanted = id ? count : std::min<size_t>(count, 1);
    if (!Read(m_resourcesOffset + offset + kFolderSize, wanted * kEntrySize)) return std::nullopt;
    for (size_t i = 0; i < wanted; ++i) {
      if (!id || Number<uint32_t>(i * kEntrySize) == *id) return Number<uint32_t>(i * kEntrySize + 4);
    }
    return std::nullopt;
  }

  // VS_VERSIONINFO: three 16-bit numbers, of which the second is the size of the fixed part, the name
  // "VS_VERSION_INFO" in UTF-16, and the fixed part at the next multiple of four.
  std::string ReadVersionBlock(uint32_t address, uint32_t size) {
    constexpr size_t kFixedPartOffset = 40;
    if (size < kFixedPartOffset + kFixedVersionInfoSize) return {};
    if (address < m_section.address || address - m_section.address >= m_section.size) return {};
    const uint64_t offset = uint64_t{m_section.fileOffset} + (address - m_section.address);
    if (!Read(offset, kFixedPartOffset + kFixedVersionInfoSize)) return {};
    if (Number<uint16_t>(2) < kFixedVersionInfoSize) return {};
    return m_bytes.substr(kFixedPartOffset, kFixedVersionInfoSize);
  }

  const ReadAt& m_readAt;
  std::string m_bytes;  // the piece that was read last
  Section m_section;
  uint64_t m_resourcesOffset = 0;
};

}  // namespace

std::string FindFixedVersionInfo(const ReadAt& readAt) {
  return PeFile(readAt).FixedVersionInfo();
}

}  // namespace systeminfo::utils
