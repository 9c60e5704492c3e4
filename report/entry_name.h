// Whether the name of an archive's entry may become a path below a folder of ours on Windows. The name is whatever
// somebody wrote into the archive. Pure functions over bytes: no Windows header.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace report {

inline constexpr size_t kLongestEntryName = 1024;     // bytes; the program's own names are far below
inline constexpr size_t kLongestNameComponent = 255;  // UTF-16 units, what NTFS allows
inline constexpr size_t kDeepestEntryName = 64;       // components

// Why the name is refused, as the rest of a sentence about the entry; null when it is safe. Safe names are UTF-8
// components divided by "/", each of which Windows takes for just that name; a name may end in "/" (a folder).
const char* EntryNameFault(std::string_view name);

// Two entries with the same key would be one file. Only ASCII letters are folded; of names that differ by the case of
// other letters the file system itself makes one, which who writes them has to notice.
std::string EntryNameKey(std::string_view name);

// Where the entry goes: `folder`, a separator, and the name with Windows' separators and none at its end. The name must
// be safe.
std::wstring EntryPath(std::wstring_view folder, std::string_view name);

}  // namespace report
