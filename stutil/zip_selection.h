// Which files go into an archive, and under which names. Pure: the records come from a walk, nothing here looks at a
// disk.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace stutil {

// One file that was found. Text is as short as it is, unlike a path string, which starts with room for 260 characters:
// there can be a hundred thousand records.
struct FileRecord {
  std::wstring path;           // the source
  std::wstring entryName;      // in the archive
  uint64_t size = 0;           // bytes
  uint64_t lastWriteTime = 0;  // seconds since 1970-01-01 UTC
};

// The most uncompressed bytes that an archive holds.
inline constexpr uint64_t kArchiveSizeLimit = 52'428'800;

struct Selection {
  std::vector<FileRecord> selected;  // newest first
  std::vector<FileRecord> skipped;   // newest first; each did not fit when its turn came
  uint64_t totalSize = 0;            // of the selected files
};

// Newest first; a file that does not fit any more is passed over, later and smaller ones may still fit.
Selection SelectWithinLimit(std::vector<FileRecord> files, uint64_t limit);

// `rootName` + "/" + the path below the folder, with "/" between its components. `path` begins with `folder`.
std::wstring MakeEntryName(std::wstring_view rootName, std::wstring_view folder, std::wstring_view path);

// From the system's file time, in units of 100 nanoseconds since 1601. Times before 1970 wrap around.
constexpr uint64_t UnixTimeFromFileTime(uint64_t fileTime) {
  return fileTime / 10'000'000 - 11'644'473'600;
}

}  // namespace stutil
