// Makes a collection of the files of a package: finds the folder of the collectors' files and parses its documents.
// Where the files come from is the caller's: an archive or a folder.
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
std::optional<std::string> CollectionFolder(const std::vector<PackageFile>& files);

// Of one collection; a package of ours has some twenty.
inline constexpr size_t kMostDocuments = 100;

using FileReader = std::function<bool(size_t index, std::string& bytes, std::string& error)>;

// Nothing when no collection is among the files.
std::optional<Collection> LoadCollection(const std::vector<PackageFile>& files, const FileReader& read);
std::optional<Collection> LoadCollection(const Archive& archive);

// A folder that an archive was unpacked into, or the folder of the collectors' files itself. Links in it are left out.
std::optional<Collection> LoadCollection(std::wstring_view folder);

}  // namespace report
