// What the issue-report window needs of the rest of the program. Handed in, because the collection lies a floor above.
#pragma once

#include <windows.h>

#include <atomic>
#include <functional>
#include <memory>
#include <string>

#include "gui/plugins.h"
#include "gui/pub_sub.h"
#include "interfaces/html_engine.h"

namespace qx {

// The results of a collection, by their numbers.
enum CollectionResult : int {
  kCollectSuccess = 0,
  kCollectionFailed = 1,
  kCollectionCancelled = 2,
  kCompressionFailed = 3,
  kSubmissionFailed = 4,
};

using CollectionProgress = std::function<void(int current, int total)>;
using CollectionFolderReady = std::function<bool(const std::wstring& folder)>;

struct TisServices {
  const HtmlEngineApi* engine = nullptr;
  std::shared_ptr<PubSub> bus;
  std::wstring programFolder;

  // A whole collection, on the calling thread; a CollectionResult. Between two collectors it looks at `cancel`.
  std::function<int(const std::atomic<bool>& cancel, const CollectionProgress& progress,
                    const CollectionFolderReady& folderReady)>
      collectData;

  // The product's logging. Restoring puts back what is raised and does nothing otherwise.
  std::function<bool()> activateLogging;
  std::function<bool()> disableLogging;
  std::function<bool()> restoreLogging;

  // The language manager for a catalogue, or null. Called once, when a text is first asked for.
  std::function<std::shared_ptr<ILanguageManager>(const std::wstring& catalogue)> languageManager;

  // Tells the user something and comes back when he has read it, meanwhile handling messages. The owner's thread.
  std::function<void(HWND owner, const std::wstring& text)> showMessage;

  // What the product is called, or null.
  std::function<std::shared_ptr<IServConfig>()> productConfig;
};

}  // namespace qx
