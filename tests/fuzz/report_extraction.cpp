// Unpacking an archive: which entries come out, where they would go, and what is in them.
#include <set>

#include "core/paths.h"
#include "report/archive.h"
#include "report/entry_name.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  std::string error;
  const auto archive = report::Archive::Open(bytes, error);
  if (archive == nullptr) {
    PROMISE(!error.empty());
    return;
  }
  constexpr size_t kMostToRead = 1 << 20;  // an input may claim more; reading that would only be slow
  uint64_t content = 0;
  std::set<std::wstring> paths;
  for (const report::ArchiveEntry& entry : archive->Entries()) {
    content += entry.size;
    const std::wstring path = report::EntryPath(L"C:\\out", entry.name);
    PROMISE(FolderContains(L"C:\\out", path) && path.find(L"..\\") == std::wstring::npos);
    PROMISE(paths.insert(path).second);
    if (entry.size > kMostToRead) continue;
    std::string text;
    const bool isRead = archive->Read(entry, text, error);
    PROMISE(isRead ? text.size() == entry.size : text.empty() && !error.empty());
  }
  PROMISE(content <= report::kMostContent);
  for (const report::Evidence& entry : archive->LeftOut())
    PROMISE(!entry.text.empty());
}
