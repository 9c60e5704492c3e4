// The name of a zip entry, and the path that it becomes.
#include "report/entry_name.h"

#include "core/paths.h"
#include "core/text.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  if (report::EntryNameFault(bytes) != nullptr) return;
  constexpr std::wstring_view kFolder = L"C:\\out";
  const std::wstring path = report::EntryPath(kFolder, bytes);
  PROMISE(path.size() > kFolder.size() + 1 && FolderContains(kFolder, path));
  PROMISE(path.find(L'/') == std::wstring::npos && path.find(L':', 2) == std::wstring::npos);
  // No component leads up, is the folder itself, or loses its end.
  const std::wstring_view components = std::wstring_view(path).substr(kFolder.size());
  for (size_t begin = 0; begin < components.size();) {
    const size_t end = std::min(components.find(L'\\', begin + 1), components.size());
    const std::wstring_view component = components.substr(begin + 1, end - begin - 1);
    PROMISE(!component.empty() && component.size() <= report::kLongestNameComponent);
    PROMISE(component.back() != L'.' && component.back() != L' ');
    begin = end;
  }
  PROMISE(report::EntryNameKey(bytes) == report::EntryNameKey(report::EntryNameKey(bytes)));
}
