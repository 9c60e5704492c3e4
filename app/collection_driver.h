// The two jobs of the program: turning a machine into a delivered package, and opening a package. Both run to
// completion on the calling thread, log every failure where it happens and throw nothing.
#pragma once

#include <atomic>
#include <functional>
#include <string>

#include "app/run_parameters.h"

namespace st {

// Results of CollectData.
inline constexpr int kCollectDone = 0;    // also when submission was switched off
inline constexpr int kCollectFailed = 1;  // nothing was collected: see the log
inline constexpr int kCollectCancelled = 2;
inline constexpr int kCompressFailed = 3;
inline constexpr int kSubmitFailed = 4;

// (percent, 100): rising, up to 50 while collecting, then 50, then 100 when the run succeeded. On the calling thread.
using ProgressCallback = std::function<void(int current, int total)>;

// Called once with the output folder, when everything is collected and nothing is packed yet, so that the caller can
// add files of its own. The answer is not looked at.
using FolderReadyCallback = std::function<bool(const std::wstring& folder)>;

// Collects into the output folder, packs it into "<folder>.zip", encrypts that in place, submits it, and deletes both
// as the parameters say. Another thread may set `cancel`; the run then ends between two collectors. What stands under
// the output folder's name beforehand is deleted, unless OutputFolderRefusal has a reason against it: then the result
// is 1 and nothing is touched.
int CollectData(const std::atomic<bool>& cancel, const CollectParameters& parameters, const ProgressCallback& progress,
                const FolderReadyCallback& folderReady);

// Opens the package with the private key and writes the plain archive, replacing an older file. On failure no output
// file is written, and an older one stays.
bool DecryptData(const DecryptParameters& parameters);

}  // namespace st
