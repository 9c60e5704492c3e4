// What goes into the archive besides the collected files: the product's log folders and the installer's logs.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace st {

// The folders that the product collector listed in "log_folders_considered.json" in the output folder, in its order.
// Empty when there is no such file or it is not a list; an element that is no folder path is logged and left out.
std::vector<std::wstring> GetFoldersToCopy(const std::wstring& outputFolder);

// Copies the files of the temporary folder tree whose path contains "qxinst." into a fresh folder "install_logs" in the
// output folder, and returns that folder; empty when it cannot be made or there is no temporary folder. Files of one
// name from several subfolders overwrite each other. The output folder itself is not searched.
std::wstring CopyInstallLogs(const std::wstring& outputFolder);

// Ends in a backslash; empty, with a logged error, when the system has none.
std::wstring GetUserTempPath();

}  // namespace st
