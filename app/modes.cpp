#include "app/modes.h"

#include <atomic>
#include <string>

#include "app/collection_driver.h"
#include "app/options.h"
#include "app/run_parameters.h"
#include "core/logging.h"
#include "core/scope_trace.h"
#include "monitoring/monitoring_manager.h"
#include "monitoring/stop_listener.h"

namespace {

constexpr wchar_t kNoGuiScope[] = L"NoGui";

int RunCollectJob(const ArgumentMap& arguments) {
  const CollectParameters parameters = BuildCollectParameters(arguments);
  const std::atomic<bool> cancel{false};  // nobody cancels in this mode
  return st::CollectData(
      cancel, parameters, [](int current, int total) { LOG_TRACE(kNoGuiScope, L"Step %d/%d", current, total); },
      [](const std::wstring&) { return true; });
}

}  // namespace

void NoGui(const ArgumentMap& arguments) {
  const logging::ScopeTrace trace(kNoGuiScope);
  if (IsGiven(arguments, options::kCollect)) {
    const int result = RunCollectJob(arguments);
    LOG_TRACE(kNoGuiScope, L"Return code %d", result);
  }
  if (IsGiven(arguments, options::kDecrypt)) {
    const bool decrypted = st::DecryptData(BuildDecryptParameters(arguments));
    LOG_TRACE(kNoGuiScope, L"Return code %d", decrypted ? 1 : 0);
  }
}

void Testing() {
  const logging::ScopeTrace trace(L"Testing");
  st::monitoring::MonitoringManager manager(L"monitoring.json");
  if (!manager.Init()) return;
  const st::monitoring::StopListener listener([&manager] { manager.Stop(); });
  manager.Start();
}
