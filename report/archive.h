// Reads a zip archive that anybody may have made. Entries that are not safe to use are left out and told; what is left
// can be read within fixed limits of memory, and its names may become paths.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "report/finding.h"

namespace report {

// A package holds 50 MiB of content by its own rule; the limits leave room for other archives of support cases.
inline constexpr size_t kMostEntries = 50'000;
inline constexpr uint64_t kMostContent = uint64_t{256} << 20;  // bytes, all entries together
// Deflate makes at most 1,032 bytes of one. A small entry may; a large one that grows so much is a bomb.
inline constexpr uint64_t kMostRatio = 500;
inline constexpr uint64_t kRatioMattersFrom = uint64_t{1} << 20;  // bytes, uncompressed

struct ArchiveEntry {
  std::string name;  // see EntryNameFault; a folder's ends in "/"
  uint64_t size = 0;
  uint32_t index = 0;
};

// Belongs to one thread.
class Archive {
 public:
  // `bytes` must outlive the archive. Empty when they are no archive, or one with too many entries; `error` says which.
  static std::unique_ptr<Archive> Open(std::string_view bytes, std::string& error);

  ~Archive();
  Archive(const Archive&) = delete;
  Archive& operator=(const Archive&) = delete;

  const std::vector<ArchiveEntry>& Entries() const { return m_entries; }
  const std::vector<Evidence>& LeftOut() const { return m_leftOut; }

  // False, with the reason, when the entry's data is damaged or is not what its size says.
  bool Read(const ArchiveEntry& entry, std::string& bytes, std::string& error) const;

 private:
  struct Reader;
  explicit Archive(std::unique_ptr<Reader> reader);
  void ListEntries();

  std::unique_ptr<Reader> m_reader;
  std::vector<ArchiveEntry> m_entries;
  std::vector<Evidence> m_leftOut;
};

}  // namespace report
