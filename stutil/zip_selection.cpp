#include "stutil/zip_selection.h"

#include <algorithm>
#include <utility>

namespace stutil {

Selection SelectWithinLimit(std::vector<FileRecord> files, uint64_t limit) {
  std::stable_sort(files.begin(), files.end(),
                   [](const FileRecord& a, const FileRecord& b) { return a.lastWriteTime > b.lastWriteTime; });
  Selection selection;
  for (FileRecord& file : files) {
    if (file.size <= limit - selection.totalSize) {
      selection.totalSize += file.size;
      selection.selected.push_back(std::move(file));
    } else {
      selection.skipped.push_back(std::move(file));
    }
  }
  return selection;
}

std::wstring MakeEntryName(std::wstring_view rootName, std::wstring_view folder, std::wstring_view path) {
  path.remove_prefix(std::min(folder.size(), path.size()));
  path.remove_prefix(std::min(path.find_first_not_of(L"\\/"), path.size()));
  std::wstring name;
  name.reserve(rootName.size() + 1 + path.size());
  name.append(rootName).append(L"/").append(path);
  std::replace(name.begin(), name.end(), L'\\', L'/');
  return name;
}

}  // namespace stutil
