// The interactive mode: the window, and the thread that closes it when it is asked to stop.
#include <windows.h>

#include <thread>
#include <utility>

#include "app/collection_driver.h"
#include "app/modes.h"
#include "app/run_parameters.h"
#include "core/logging.h"
#include "core/program_path.h"
#include "core/scope_exit.h"
#include "core/scope_trace.h"
#include "core/scoped.h"
#include "gui/application.h"
#include "gui/engine.h"
#include "gui/tis_wnd.h"
#include "stutil/product_logging.h"
#include "stutil/product_logging_guard.h"

namespace {

constexpr wchar_t kScope[] = L"WithGui";

static_assert(static_cast<int>(qx::kCollectSuccess) == st::kCollectDone &&
              static_cast<int>(qx::kCollectionFailed) == st::kCollectFailed &&
              static_cast<int>(qx::kCollectionCancelled) == st::kCollectCancelled &&
              static_cast<int>(qx::kCompressionFailed) == st::kCompressFailed &&
              static_cast<int>(qx::kSubmissionFailed) == st::kSubmitFailed);

void ShowMessage(HWND owner, const std::wstring& text) {
  MessageBoxW(owner, text.c_str(), L"Support Tool", MB_OK | MB_ICONERROR | MB_SETFOREGROUND);
}

qx::TisServices Services(qx::Application& application, CollectParameters parameters) {
  qx::TisServices services;
  services.engine = &qx::gui::Engine();
  services.bus = application.Bus();
  services.programFolder = ProgramFolder();
  services.collectData = [parameters = std::move(parameters)](const std::atomic<bool>& cancel,
                                                              const qx::CollectionProgress& progress,
                                                              const qx::CollectionFolderReady& folderReady) {
    return st::CollectData(cancel, parameters, progress, folderReady);
  };
  services.activateLogging = &stutil::ActivateProductLogging;
  services.disableLogging = &stutil::DisableProductLogging;
  services.restoreLogging = &stutil::RestoreProductLogging;
  services.languageManager = [](const std::wstring& catalogue) {
    const qx::ComponentManager manager(catalogue);
    return qx::ServPlugin<qx::ILanguageManager>::GetPlugin(&manager);
  };
  services.showMessage = &ShowMessage;
  services.productConfig = [&application] { return application.ProductConfig(); };
  return services;
}

void WaitForStop(HANDLE stopEvent, TisWnd& window) {
  WaitForSingleObject(stopEvent, INFINITE);
  LOG_TRACE(kScope, L"StopEvent signaled... exiting");
  window.Ui().PostClose([&window] {
    if (window.Handle() != nullptr) SendMessageW(window.Handle(), WM_CLOSE, 0, 0);
  });
}

void ShowUntilStopped(TisWnd& window, HANDLE stopEvent) {
  window.SetStopEvent(stopEvent);
  std::thread waiter(WaitForStop, stopEvent, std::ref(window));
  const ScopeExit join([&waiter, stopEvent] {
    SetEvent(stopEvent);  // also when there is no window, or the loop has ended by an exception
    waiter.join();
  });
  if (window.Init()) window.RunMessageLoop();
}

}  // namespace

void WithGui(const ArgumentMap& arguments) {
  const logging::ScopeTrace trace(kScope);
  qx::Application& application = qx::Application::Get();
  const stutil::ProductLoggingGuard guard([] { stutil::RestoreProductLogging(); });
  TisWnd window(Services(application, BuildCollectParameters(arguments)));
  const KernelHandle stopEvent(CreateEventW(nullptr, FALSE, FALSE, nullptr));
  if (!stopEvent) {
    LOG_TRACE(kScope, L"Failed to create stop event");
    return;
  }
  ShowUntilStopped(window, stopEvent.Get());
}
