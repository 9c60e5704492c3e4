#include "app/collection_driver.h"

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "core/files.h"
#include "core/logging.h"
#include "core/scoped.h"
#include "tests/support/temporary_folder_at.h"
#include "tests/support/test_folder.h"

namespace {

// A run in a folder of its own, with the quickest collector and without submission.
struct StagedRun {
  TestFolder folder;
  TemporaryFolderAt temporaryFolder{folder.MakeFolder(L"temporary")};
  CollectParameters parameters;
  std::atomic<bool> cancel{false};
  std::vector<int> progress;
  std::vector<std::wstring> readyFolders;
  logging::ErrorCapture errors;

  StagedRun() {
    parameters.settingsFile = folder.MakeFile(L"settings.json", R"({"system_summary": true})");
    parameters.outputFolder = folder.Path(L"out");
    parameters.cloudSubmit = false;
    parameters.encrypt = false;
    parameters.deleteArchive = false;
    parameters.deleteTemporaryFolder = false;
  }

  int Collect(const st::FolderReadyCallback& folderReady = [](const std::wstring&) { return true; }) {
    return st::CollectData(
        cancel, parameters,
        [this](int current, int total) {
          EXPECT_EQ(total, 100);
          progress.push_back(current);
        },
        [this, &folderReady](const std::wstring& ready) {
          readyFolders.push_back(ready);
          return folderReady(ready);
        });
  }
};

}  // namespace

TEST(CollectData, CallerAddsFilesToTheFolderBeforeItIsPacked) {
  StagedRun run;
  run.parameters.deleteTemporaryFolder = true;
  const int result = run.Collect([&](const std::wstring& folder) {
    EXPECT_TRUE(PathExists(folder + L"\\system_summary.json"));
    EXPECT_TRUE(PathExists(folder + L"\\collection_manifest.json"));
    EXPECT_FALSE(PathExists(folder + L".zip"));
    EXPECT_EQ(WriteWholeFile(folder + L"\\guiData.json", std::string_view("{}")), ERROR_SUCCESS);
    return false;  // not looked at
  });
  EXPECT_EQ(result, st::kCollectDone);
  EXPECT_EQ(run.readyFolders, std::vector<std::wstring>{run.parameters.outputFolder});
  EXPECT_EQ(run.progress, (std::vector<int>{50, 50, 100}));
  EXPECT_FALSE(FolderExists(run.parameters.outputFolder));
  std::string archive;
  ASSERT_EQ(ReadWholeFile(run.parameters.outputFolder + L".zip", 1 << 20, archive), ERROR_SUCCESS);
  EXPECT_NE(archive.find("out/guiData.json"), std::string::npos);
  EXPECT_NE(archive.find("out/system_summary.json"), std::string::npos);
}

TEST(CollectData, CancelledRunPacksNothingAndKeepsTheFolder) {
  StagedRun run;
  run.cancel = true;
  run.parameters.deleteTemporaryFolder = true;
  EXPECT_EQ(run.Collect(), st::kCollectCancelled);
  EXPECT_TRUE(run.progress.empty());
  EXPECT_TRUE(run.readyFolders.empty());
  EXPECT_TRUE(FolderExists(run.parameters.outputFolder));
  EXPECT_FALSE(PathExists(run.parameters.outputFolder + L".zip"));
}

TEST(CollectData, FileHeldOpenInAnExistingFolderIsAFailureNotAMix) {
  StagedRun run;
  const std::wstring held = run.folder.MakeFile(L"out\\held.txt", "held");
  const KernelHandle handle(
      CreateFileW(held.c_str(), GENERIC_READ, 0, nullptr, OPEN_EXISTING, FILE_ATTRIBUTE_NORMAL, nullptr));
  ASSERT_TRUE(handle);
  EXPECT_EQ(run.Collect(), st::kCollectFailed);
  EXPECT_FALSE(PathExists(run.parameters.outputFolder + L".zip"));
  EXPECT_FALSE(run.errors.Take().empty());
}

TEST(CollectData, RefusedFolderIsNotTouched) {
  StagedRun run;
  const std::wstring kept = run.folder.MakeFile(L"kept.txt", "kept");
  wchar_t before[MAX_PATH] = {};
  GetCurrentDirectoryW(MAX_PATH, before);
  ASSERT_TRUE(SetCurrentDirectoryW(run.folder.MakeFolder(L"sub").c_str()));
  for (const wchar_t* folder : {L"..", L".", L"", L"x\\..\\.."}) {
    run.parameters.outputFolder = folder;
    EXPECT_EQ(run.Collect(), st::kCollectFailed) << folder;
  }
  SetCurrentDirectoryW(before);
  EXPECT_TRUE(PathExists(kept));
}

TEST(CollectData, ExceptionOfACallbackEndsTheRunAndNothingElse) {
  StagedRun run;
  EXPECT_EQ(run.Collect([](const std::wstring&) -> bool { throw std::runtime_error("no more"); }), st::kCollectFailed);
  EXPECT_EQ(run.errors.Take(), std::vector<std::wstring>{L"st::CollectData: the run was given up: no more"});
}
