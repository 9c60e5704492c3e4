#include "stutil/zip.h"

#include <ctime>
#include <exception>
#include <new>
#include <system_error>

#include "core/files.h"
#include "core/folder_entries.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/text.h"
#include "core/walk_dir.h"
#include "stutil/entry_assembler.h"
#include "stutil/pack_pipeline.h"
#include "stutil/pack_plan.h"
#include "stutil/retry_copy.h"
#include "stutil/zip_selection.h"

namespace stutil {
namespace {

constexpr wchar_t kFunction[] = L"stutil::CompressWithSizeLimit_MostRecentFirst";

constexpr uint64_t Combine(DWORD high, DWORD low) {
  return uint64_t{high} << 32 | low;
}

// Adds the files below `folder`, without the archive that is being written.
void CollectRecords(std::wstring_view folder, std::wstring_view archivePath, std::vector<FileRecord>& files) {
  const std::wstring_view rootName = LastPathComponent(folder);
  WalkDir(folder, [&](const qx::PathString& path, WIN32_FIND_DATAW entry) {
    if (IsFolder(entry) || IsLink(entry)) return kWalkContinue;
    const std::wstring_view source(path.c_str(), path.size());
    if (source.ends_with(kPartialSuffix) && ExtendedPath(source) == archivePath) return kWalkContinue;
    files.push_back(
        {std::wstring(source), MakeEntryName(rootName, folder, source),
         Combine(entry.nFileSizeHigh, entry.nFileSizeLow),
         UnixTimeFromFileTime(Combine(entry.ftLastWriteTime.dwHighDateTime, entry.ftLastWriteTime.dwLowDateTime))});
    return kWalkContinue;
  });
}

struct Contents {
  std::vector<FileRecord> files;           // to compress, newest first
  std::vector<std::wstring> emptyFolders;  // entry names of the source folders without files: they show all the same
};

Contents SelectContents(const std::vector<std::wstring>& folders, const std::wstring& archivePath) {
  std::vector<FileRecord> files;
  std::vector<std::wstring> emptyFolders;
  for (const std::wstring& folder : folders) {
    if (!FolderExists(folder)) {
      LOG_ERROR(kFunction, L"compression source does not exist");
      continue;
    }
    const size_t before = files.size();
    CollectRecords(folder, archivePath, files);
    if (files.size() == before) emptyFolders.push_back(std::wstring(LastPathComponent(folder)) + L"/");
  }
  Selection selection = SelectWithinLimit(std::move(files), kArchiveSizeLimit);
  for (const FileRecord& file : selection.skipped) {
    LOG_TRACE(kFunction, L"skipping [lastWriteTime %u] [fileSize %llu] [fileName %s]",
              static_cast<uint32_t>(file.lastWriteTime), file.size, file.path.c_str());
  }
  LOG_INFO(kFunction, L"[files to compress %d] [archive size %llu]", static_cast<int>(selection.selected.size()),
           selection.totalSize);
  return {std::move(selection.selected), std::move(emptyFolders)};
}

void AddEmptyFolders(ScopedZipArchive& archive, const std::vector<std::wstring>& names) {
  const auto now = static_cast<uint64_t>(std::time(nullptr));
  for (const std::wstring& name : names) {
    if (!archive.Add({name, now}, {})) LOG_ERROR(kFunction, L"cannot add folder %s", name.c_str());
  }
}

void Pack(ScopedZipArchive& archive, const std::vector<FileRecord>& files) {
  const std::vector<PackJob> jobs = PlanJobs(files);
  PackPipeline pipeline(files, jobs);
  EntryAssembler assembler(archive);
  CopyRetrier retrier(archive);
  for (const PackJob& job : jobs) {
    const PackedJob& packed = pipeline.Next();
    for (size_t i = 0; i < packed.parts.size(); ++i) {
      const FileRecord& file = files[job.firstFile + i];
      if (job.offset == 0) {
        LOG_TRACE(kFunction, L"[lastWriteTime %llu] [fileSize %llu] Compressing %s into archive_root/%s",
                  file.lastWriteTime, file.size, file.path.c_str(), file.entryName.c_str());
      }
      const EntryState state = assembler.Add(job, packed, i, file);
      if (archive.IsBroken()) return;  // logged when the archive is finalized
      if (state != EntryState::kFailed) continue;
      LOG_ERROR(kFunction, L"cannot add file %s : %s", file.entryName.c_str(), file.path.c_str());
      if (retrier.Add(file)) {
        LOG_TRACE(kFunction, L"-> OK after retry file %s : %s", file.entryName.c_str(), file.path.c_str());
      }
    }
  }
}

// Memory or threads ran out; the archive holds what was packed before.
bool EndedEarly(const std::exception& error) {
  LOG_ERROR(kFunction, L"compression ended early: %s", ToWide(error.what()).c_str());
  return false;
}

}  // namespace

bool CompressWithSizeLimit_MostRecentFirst(const std::vector<std::wstring>& folders, const std::wstring& archivePath) {
  try {
    ScopedZipArchive archive(archivePath);
    if (!archive.IsOpen()) return false;
    const Contents contents = SelectContents(folders, archive.PartialPath());
    AddEmptyFolders(archive, contents.emptyFolders);
    if (!contents.files.empty()) Pack(archive, contents.files);
    return true;
  } catch (const std::bad_alloc& error) {
    return EndedEarly(error);
  } catch (const std::system_error& error) {  // no thread could be started
    return EndedEarly(error);
  }
}

}  // namespace stutil
