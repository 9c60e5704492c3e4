#include "app/collection_driver.h"

#include <windows.h>

#include <exception>
#include <memory>
#include <utility>
#include <vector>

#include "app/folders_to_pack.h"
#include "app/output_folder.h"
#include "core/delete_folder.h"
#include "core/files.h"
#include "core/logging.h"
#include "core/scope_exit.h"
#include "core/scope_trace.h"
#include "stutil/package.h"
#include "stutil/submission.h"
#include "stutil/zip.h"
#include "systeminfo/collecting_settings.h"
#include "systeminfo/collection_manifest.h"
#include "systeminfo/data_collector.h"

namespace st {
namespace {

using systeminfo::CollectingSettings;

constexpr wchar_t kScope[] = L"st::CollectData";
constexpr int kWholeProgress = 100;
constexpr int kProgressCollected = 50;

std::shared_ptr<CollectingSettings> SettleSettings(const CollectParameters& parameters) {
  const CollectingSettings defaults = BuildDefaultCollectingSettings(parameters);
  const Json::Value defaultFolder = defaults.GetValue(L"output_folder");
  auto settings = std::make_shared<CollectingSettings>();
  if (!settings->LoadFromFile(parameters.settingsFile)) {
    *settings = defaults;
  } else if (parameters.outputFolder != kDefaultCollectParameters.outputFolder) {
    settings->SetValue(L"output_folder", defaultFolder);
  }
  if (!settings->HasKey(L"output_folder")) {
    LOG_WARNING(kScope, L"No output folder set in settings file. Setting the default one");
    settings->SetValue(L"output_folder", defaultFolder);
  }
  return settings;
}

// Makes room for a fresh output folder. False, with nothing touched, when that would cost the user something else.
bool ClearOutputFolder(const std::wstring& folder) {
  std::wstring refusal = OutputFolderRefusal(NormalFolder(folder), ProtectedFolders());
  if (refusal.empty() && IsFolderLink(folder)) refusal = L"it is a link to another folder";
  if (!refusal.empty()) {
    LOG_ERROR(kScope, L"output folder '%s' is refused: %s", folder.c_str(), refusal.c_str());
    return false;
  }
  if (!IsAbsent(folder) && !DeleteFolder(folder, true)) {
    LOG_ERROR(kScope, L"the existing output folder %s could not be deleted", folder.c_str());
  }
  return true;  // a folder that is still there is the runner's to refuse
}

// Runs the collectors over the first half of the progress, and adds the manifest. The result is the runner's.
int Collect(const std::shared_ptr<CollectingSettings>& settings, const std::wstring& folder,
            const std::atomic<bool>& cancel, const ProgressCallback& progress) {
  LOG_TRACE(kScope, L"--> COLLECT");
  systeminfo::ManifestHeader header{ST_VERSION, systeminfo::CurrentTimeUtc(), {}, 0};
  systeminfo::DataCollectorImpl collector(settings);
  const int result = collector.CollectAll(&cancel, [&progress](int step, int steps) {
    const double scaled = static_cast<double>(step) / steps * 0.5;
    LOG_TRACE(kScope, L"progress scaled percent %f [%d/%d]", scaled, step, steps);
    progress(static_cast<int>(scaled * kWholeProgress), kWholeProgress);
  });
  LOG_TRACE(kScope, L"<-- COLLECT");
  if (result == systeminfo::kRunDone) {
    header.endUtc = systeminfo::CurrentTimeUtc();
    header.utcOffsetMinutes = systeminfo::CurrentUtcOffset();
    systeminfo::WriteManifest(folder, header, collector.Outcomes());
  }
  return result;
}

void DeleteArchive(const std::wstring& archive) {
  if (DeleteFileW(ExtendedPath(archive).c_str())) return;
  const DWORD error = GetLastError();
  LOG_WARNING(kScope, L"Failed to delete generated zip file.");
  LOG_TRACE(kScope, L"error %u", error);
}

void DeleteCollectedData(const std::wstring& folder) {
  if (IsAbsent(folder)) return;
  if (DeleteFolder(folder, true)) {
    LOG_TRACE(kScope, L"Deleted folder with collected data");
  } else {
    LOG_WARNING(kScope, L"failed to delete folder with collected data");
  }
}

std::vector<std::wstring> GatherFolders(const std::wstring& outputFolder) {
  std::vector<std::wstring> folders = GetFoldersToCopy(outputFolder);
  std::wstring installLogs = CopyInstallLogs(outputFolder);
  if (!installLogs.empty()) folders.push_back(std::move(installLogs));
  folders.push_back(outputFolder);
  return folders;
}

// Encrypts and submits as the parameters say. An encryption that fails leaves no archive, so that the submission fails.
int Deliver(const CollectParameters& parameters, const std::wstring& archive) {
  if (parameters.encrypt) {
    LOG_TRACE(kScope, L"-> Encrypt");
    stutil::Encrypt(archive);
    LOG_TRACE(kScope, L"<- Encrypt");
  }
  if (!parameters.cloudSubmit) {
    LOG_TRACE(kScope, L"cloudSubmission is disabled from command line");
  } else if (!stutil::TessaroSubmitFile(0, archive)) {
    LOG_ERROR(kScope, L"submission to tessaro failed");
    return kSubmitFailed;
  }
  return kCollectDone;
}

// From the collected folder to the delivered package. The clean-ups run when this ends, the folder's first.
int PackAndDeliver(const CollectParameters& parameters, const std::wstring& folder) {
  // Separators at the end do not belong to the name that ".zip" is appended to.
  const std::wstring archive = folder.substr(0, folder.find_last_not_of(L"\\/") + 1) + L".zip";
  ScopeExit archiveCleanup([&archive] { DeleteArchive(archive); });
  if (!parameters.deleteArchive) {
    LOG_TRACE(kScope, L"Not deleting archive");
    archiveCleanup.Disarm();
  }

  LOG_TRACE(kScope, L"--> COMPRESS");
  const std::vector<std::wstring> folders = GatherFolders(folder);
  ScopeExit folderCleanup([&folder] { DeleteCollectedData(folder); });
  if (!parameters.deleteTemporaryFolder) folderCleanup.Disarm();
  LOG_TRACE(kScope, L"Creating zip archive %s", archive.c_str());
  if (!stutil::CompressWithSizeLimit_MostRecentFirst(folders, archive)) {
    LOG_ERROR(kScope, L"Failed to compress folders");
    return kCompressFailed;
  }
  LOG_TRACE(kScope, L"<-- COMPRESS");
  return Deliver(parameters, archive);
}

int RunCollection(const std::atomic<bool>& cancel, const CollectParameters& parameters,
                  const ProgressCallback& progress, const FolderReadyCallback& folderReady) {
  const std::shared_ptr<CollectingSettings> settings = SettleSettings(parameters);
  std::wstring folder;
  if (settings->GetOutputFolderValue(folder) == systeminfo::OutputFolderStatus::kFound && !ClearOutputFolder(folder)) {
    return kCollectFailed;
  }
  // A folder that is no text is the runner's to refuse.
  const int collected = Collect(settings, folder, cancel, progress);
  if (collected == systeminfo::kRunCancelled) return kCollectCancelled;
  if (collected != systeminfo::kRunDone) return kCollectFailed;
  progress(kProgressCollected, kWholeProgress);
  folderReady(folder);
  const int result = PackAndDeliver(parameters, folder);
  if (result == kCollectDone) progress(kWholeProgress, kWholeProgress);
  return result;
}

}  // namespace

int CollectData(const std::atomic<bool>& cancel, const CollectParameters& parameters, const ProgressCallback& progress,
                const FolderReadyCallback& folderReady) {
  const logging::ScopeTrace trace(kScope);
  try {
    return RunCollection(cancel, parameters, progress, folderReady);
  } catch (const std::exception& exception) {  // out of memory, or a callback of the caller's
    LOG_ERROR(kScope, L"the run was given up: %S", exception.what());
  }
  return kCollectFailed;
}

}  // namespace st
