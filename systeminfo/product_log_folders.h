// Which folders of the product are packed with the collection: its logs, its settings and its crash dumps.
#pragma once

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace systeminfo {

struct ProductPlaces {
  std::wstring commonData;       // what %programData% means
  std::wstring installLocation;  // absolute
  std::wstring dumpFolder;  // with its variables expanded; a relative one lies in the install location; may be empty
};

// Where the product may have such folders, absolute, whether they are there or not:
//   <common data>\Quorvex\Logs, <common data>\Quorvex\QXLogging, <install location>\settings, the dump folder
std::vector<std::wstring> CandidateLogFolders(const ProductPlaces& places);

struct LogFolderChoice {
  std::vector<std::wstring> folders;  // in the order of the candidates, absolute, none of them in another one
  std::vector<std::wstring> refused;  // roots of drives, and what holds the output folder: they would pack anything
};

// Of the candidates those that exist. A folder that lies in another one is packed with that and not listed itself.
LogFolderChoice ChooseLogFolders(const std::vector<std::wstring>& candidates, std::wstring_view outputFolder,
                                 const std::function<bool(const std::wstring&)>& exists);

// Finds the folders of the product on this machine and writes them, as a JSON array of texts, to
// "log_folders_considered.json" in the output folder. Failures are logged.
void WriteLogFoldersConsidered(const std::wstring& installLocation, const std::wstring& outputFolder);

}  // namespace systeminfo
