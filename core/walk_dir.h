// Visits everything below a folder. Paths may have any length and names may end in dots or spaces; folders that vanish
// during the walk, or may not be listed, are passed over.
#pragma once

#include <windows.h>

#include <cstdint>
#include <functional>
#include <string_view>

#include "core/path_string.h"

// The answer for one entry.
enum WalkDir_Ret : uint32_t {
  kWalkContinue = 0,  // go on; walk into it when it is a folder
  kWalkStop = 1,      // end the whole walk at once
  kWalkSkip = 2,      // go on, but do not walk into it
};

// The path is the root as given, joined with the names below it; it is valid during the call. What the callback throws
// ends the walk.
using WalkDirEntryCallback = std::function<WalkDir_Ret(const qx::PathString& path, WIN32_FIND_DATAW entry)>;
using WalkDirAttributesCallback = std::function<WalkDir_Ret(const qx::PathString& path, uint32_t attributes)>;

// Calls `callback` for every file and folder below `root`, the root not included, on the calling thread. All entries of
// a folder come in a row, before those of its subfolders; otherwise the order is open. A junction or symbolic link to a
// folder is an entry like any other, but is not walked into, so that no walk goes in circles.
// False only when the root is empty text or cannot be listed (the callback is never called then); a walk ended by
// kWalkStop is true. A folder that is there and cannot be listed, or not to its end, is logged. The record has no
// short name.
bool WalkDir(std::wstring_view root, const WalkDirEntryCallback& callback);
bool WalkDir(std::wstring_view root, const WalkDirAttributesCallback& callback);
