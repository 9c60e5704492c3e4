// Which folder a run may collect into. Whatever stands under the output folder's name is deleted with everything in it
// before a run, so that a slip in an option or a settings file must not cost a user a profile or a drive.
#pragma once

#include <string>
#include <string_view>
#include <vector>

struct ProtectedFolder {
  std::wstring path;  // in the form of NormalFolder
  const wchar_t* what;
};

// Why `folder` is not taken, or an empty text when it is: it is empty, no path, the root of a drive or a share, not on
// a drive or a share at all, or equal to, or above, a protected folder. `folder` in the form of NormalFolder; case is
// ignored as the file system ignores it.
std::wstring OutputFolderRefusal(std::wstring_view folder, const std::vector<ProtectedFolder>& protectedFolders);

// The one spelling of a folder, with the prefix \\?\: absolute and, when the folder exists, with links, substituted
// drives and short names followed to the real place.
std::wstring NormalFolder(std::wstring_view folder);

// The folder exists and is a junction or a symbolic link: what stands in it is somebody else's.
bool IsFolderLink(std::wstring_view folder);

// The current directory, the program's, the system's and the user's own folders.
std::vector<ProtectedFolder> ProtectedFolders();
