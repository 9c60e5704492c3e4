#include "report/loading.h"

#include <algorithm>

#include "core/files.h"
#include "core/paths.h"
#include "core/text.h"
#include "core/walk_dir.h"
#include "report/windows_text.h"

namespace report {
namespace {

constexpr std::string_view kExtension = ".json";

// The document's name when `path` is that of one, at the top or one folder below it; else nothing.
std::string_view DocumentName(std::string_view path) {
  const std::string_view folder = FolderOf(path);
  std::string_view name = FileNameOf(path);
  if (folder.find('/') != std::string_view::npos || !name.ends_with(kExtension)) return {};
  name.remove_suffix(kExtension.size());
  return name;
}

// "collected\services.json" of a folder becomes "collected/services.json".
std::string EntryNameOf(std::wstring_view root, std::wstring_view path) {
  std::string name = ToUtf8(path.substr(std::min(path.size(), root.size())));
  std::replace(name.begin(), name.end(), '\\', '/');
  name.erase(0, std::min(name.find_first_not_of('/'), name.size()));
  return name;
}

std::vector<PackageFile> ListFolder(const std::wstring& root, std::vector<Evidence>& leftOut) {
  std::vector<PackageFile> files;
  WalkDir(root, [&](const qx::PathString& path, const WIN32_FIND_DATAW& entry) {
    if ((entry.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) return kWalkContinue;
    std::string name = EntryNameOf(root, path);
    if ((entry.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0) {
      leftOut.push_back({std::move(name), "", "is a link"});
      return kWalkContinue;
    }
    const uint64_t size = uint64_t{entry.nFileSizeHigh} << 32 | entry.nFileSizeLow;
    files.push_back({std::move(name), size});
    return files.size() < kMostEntries ? kWalkContinue : kWalkStop;
  });
  if (files.size() == kMostEntries)
    leftOut.push_back({ToUtf8(root), "", "holds too many files: not all were looked at"});
  return files;
}

void LoadDocument(Collection& collection, const PackageFile& file, size_t index, const FileReader& read) {
  const std::string_view name = DocumentName(file.name);
  if (file.size > kLargestDocument) {
    collection.unreadable.push_back({std::string(name) + ".json", "", "is too large to be read"});
    return;
  }
  std::string bytes;
  std::string error;
  if (read(index, bytes, error)) {
    AddDocument(collection, name, bytes);
  } else {
    collection.unreadable.push_back({std::string(name) + ".json", "", error});
  }
}

}  // namespace

std::optional<std::string> CollectionFolder(const std::vector<PackageFile>& files) {
  const std::string* any = nullptr;
  for (const auto& [name, size] : files) {
    const std::string_view document = DocumentName(name);
    if (!IsDocumentName(document)) continue;
    if (any == nullptr || document == kManifestName) any = &name;
    if (document == kManifestName) break;
  }
  if (any == nullptr) return std::nullopt;
  return any->substr(0, any->size() - FileNameOf(*any).size());
}

std::optional<Collection> LoadCollection(const std::vector<PackageFile>& files, const FileReader& read) {
  Collection collection;
  collection.files = files;
  const auto folder = CollectionFolder(files);
  if (!folder) return std::nullopt;
  size_t documents = 0;
  // Those that the rules read come first, so that no number of others keeps them out.
  for (const bool isOwn : {true, false}) {
    for (size_t i = 0; i < files.size(); ++i) {
      const std::string& name = files[i].name;
      const std::string_view document = DocumentName(name);
      const bool isInFolder = name.starts_with(*folder) && FileNameOf(name).size() + folder->size() == name.size();
      if (!isInFolder || document.empty() || IsDocumentName(document) != isOwn) continue;
      if (documents++ < kMostDocuments) LoadDocument(collection, files[i], i, read);
    }
  }
  SetCollectionTime(collection);
  return collection;
}

std::optional<Collection> LoadCollection(const Archive& archive) {
  std::vector<PackageFile> files;
  for (const ArchiveEntry& entry : archive.Entries())
    files.push_back({entry.name, entry.size});
  auto collection = LoadCollection(files, [&](size_t index, std::string& bytes, std::string& error) {
    return archive.Read(archive.Entries()[index], bytes, error);
  });
  if (collection) collection->leftOut = archive.LeftOut();
  return collection;
}

std::optional<Collection> LoadCollection(std::wstring_view folder) {
  const std::wstring root(WithoutEndSeparators(folder));
  std::vector<Evidence> leftOut;
  const std::vector<PackageFile> files = ListFolder(root, leftOut);
  auto collection = LoadCollection(files, [&](size_t index, std::string& bytes, std::string& error) {
    const DWORD code = ReadWholeFile(JoinPath(root, ToWide(files[index].name)), kLargestDocument, bytes);
    error = "cannot be read, error " + std::to_string(code);
    return code == ERROR_SUCCESS;
  });
  if (collection) collection->leftOut = std::move(leftOut);
  return collection;
}

}  // namespace report
