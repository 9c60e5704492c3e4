// Makes a collection of the files of a package: finds the folder of the collectors' files and parses those that the
// rules read. Where the files come from is the caller's: an archive or a folder.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "report/archive.h"
#include "report/collection.h"

namespace report {

// Larger documents are not parsed: in memory one takes many times its size.
inline constexpr uint64_t kLargestDocument = uint64_t{32} << 20;

// What the names of the collectors' files begin with: "collected/", or nothing when they lie at the top. The folder of
// the manifest; without one, the first folder with any document. Nothing when there is none: this is no collection.
std::optional<std::string> CollectionFolder(const std::vector<std::string>& names);

struct SourceFile {
  std::string name;  // components divided by "/"
  uint64_t size = 0;
};
using FileReader = std::function<bool(size_t index, std::string& bytes, std::string& error)>;

// Nothing when no collection is among the files.
std::optional<Collection> LoadCollection(const std::vector<SourceFile>& files, const FileReader& read);
std::optional<Collection> LoadCollection(const Archive& archive);

// A folder that an archive was unpacked into, or the folder of the collectors' files itself. Links in it are left out.
std::optional<Collection> LoadCollection(std::wstring_view folder);

}  // namespace report
