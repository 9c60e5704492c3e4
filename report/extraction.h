// Unpacks an archive into a folder that is new or empty. Nothing is written anywhere else, and no file over another.
#pragma once

#include <string>
#include <string_view>

#include "report/archive.h"
#include "report/finding.h"

namespace report {

// Why the folder cannot take the files; empty when it can, and is there then. One that already holds something is
// refused: a link in it could lead anywhere.
std::string PrepareFolder(const std::wstring& folder);

// Returns the entries that were not written, each with the reason; the others are whole.
std::vector<Evidence> ExtractArchive(const Archive& archive, std::wstring_view folder);

}  // namespace report
