// Removes a folder with everything in it, whatever the depth of the tree and the length of its paths.
#pragma once

#include <string_view>

// True only when everything, the folder included, was removed; what cannot be removed does not keep the rest from being
// removed. With `force`, a file or folder that is refused with "access denied" is made writable and tried once more. A
// junction or symbolic link to a folder, `folder` too, is removed itself, never what it leads to.
// Empty text and the root of a drive or share are refused: a root can never be removed, and would only be emptied.
bool DeleteFolder(std::wstring_view folder, bool force);
