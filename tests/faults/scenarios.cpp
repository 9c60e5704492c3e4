#include "tests/faults/scenarios.h"

#include <windows.h>

#include <algorithm>
#include <atomic>
#include <fstream>
#include <iterator>
#include <thread>

#include "app/collection_driver.h"
#include "app/instance.h"
#include "app/modes.h"
#include "core/files.h"
#include "core/scoped.h"
#include "core/text.h"
#include "monitoring/monitoring_manager.h"
#include "monitoring/stop_listener.h"
#include "stutil/product_logging.h"
#include "stutil/submission.h"
#include "systeminfo/collector_table.h"
#include "systeminfo/data_collector.h"

namespace faults {
namespace {

constexpr wchar_t kFolder[] = L"collected";
constexpr char kTemporary[] = "collected collected.zip outbox decrypted.zip";

// A run that nothing else ends is stopped as a user stops it.
constexpr auto kMonitoringTime = std::chrono::milliseconds(700);
constexpr char kMonitoring[] = R"({
  "performanceCounters": [{"id": "uptime", "query": "\\System\\System Up Time", "sampleInterval": 10,
                           "saveToFile": true, "triggers": ["soon"]}],
  "triggers": [{"id": "soon", "triggerAfter": 3, "counterValue": 0, "condition": ">", "action": []}],
  "actions": []})";

CollectParameters Parameters() {
  CollectParameters parameters;
  parameters.outputFolder = kFolder;
  return parameters;
}

int Collect(const CollectParameters& parameters) {
  const std::atomic<bool> cancel{false};
  return st::CollectData(
      cancel, parameters, [](int, int) {}, [](const std::wstring&) { return true; });
}

Scenario Collection() {
  return {"collection",
          [] { WriteWholeFile(L"stsettings.json", R"({"system_summary": true})"); },
          [] { return Collect(Parameters()); },
          st::kCollectDone,
          {st::kCollectDone, st::kCollectFailed, st::kCompressFailed, st::kSubmitFailed},
          kTemporary};
}

Scenario OneCollector(const wchar_t* key) {
  const auto run = [key] {
    const auto settings = std::make_shared<systeminfo::CollectingSettings>();
    settings->SetValue(L"output_folder", Json::Value(ToUtf8(kFolder)));
    settings->SetValue(key, Json::Value(true));
    systeminfo::DataCollectorImpl collector(settings);
    const std::atomic<bool> cancel{false};
    const int result = collector.CollectAll(&cancel, {});
    if (result == systeminfo::kRunDone) systeminfo::WriteManifest(kFolder, {}, collector.Outcomes());
    return result;
  };
  return {ToUtf8(key),
          [] {},
          run,
          systeminfo::kRunDone,
          {systeminfo::kRunDone, systeminfo::kRunNoOutputFolder, systeminfo::kRunNoWmi},
          kTemporary};
}

Scenario Decryption() {
  const auto prepare = [] {
    if (PathExists(L"package.bin")) return;
    CollectParameters parameters = Parameters();
    parameters.deleteArchive = false;
    parameters.cloudSubmit = false;
    Collect(parameters);
    MoveFileW(L"collected.zip", L"package.bin");
  };
  const auto run = [] { return st::DecryptData({L"package.bin", L"decrypted.zip", L"privateKey.pem"}) ? 1 : 0; };
  return {"decryption", prepare, run, 1, {0, 1}, kTemporary};
}

Scenario Upload(const char* name) {
  return {name, [] {}, [] { return stutil::TessaroSubmitFile(0, L"upload.bin") ? 1 : 0; }, 1, {0, 1}, kTemporary};
}

Scenario Monitoring() {
  const auto prepare = [] { WriteWholeFile(L"monitoring.json", std::string_view(kMonitoring)); };
  const auto run = [] {
    const KernelHandle stop(CreateEventExW(nullptr, L"Local\\QuorvexSupportToolStopMonitoring", 0, EVENT_ALL_ACCESS));
    const KernelHandle done(CreateEventExW(nullptr, nullptr, 0, EVENT_ALL_ACCESS));
    std::thread user([&] {
      if (WaitForSingleObject(done.Get(), static_cast<DWORD>(kMonitoringTime.count())) == WAIT_TIMEOUT)
        SetEvent(stop.Get());
    });
    Testing();
    SetEvent(done.Get());
    user.join();
    std::ifstream samples("uptime.csv");  // by calls that do not fail
    return std::count(std::istreambuf_iterator<char>(samples), {}, '\n') > 1 ? 0 : 1;
  };
  return {"monitoring", prepare, run, 0, {0, 1}, "uptime.csv"};
}

Scenario Start() {
  const auto run = [] {
    if (!CheckSingleInstance(L"Local\\QuorvexSupportToolFaultWalk").isSingle) return 0;
    stutil::RestoreProductLogging();
    return 1;
  };
  return {"start", [] {}, run, 1, {0, 1}, ""};
}

}  // namespace

std::vector<Scenario> AllScenarios() {
  std::vector<Scenario> scenarios{Start(),          Collection(),           Decryption(),
                                  Upload("upload"), Upload("upload_https"), Monitoring()};
  for (const systeminfo::CollectorRow& row : systeminfo::CollectorTable()) {
    const bool isKnown = std::any_of(scenarios.begin(), scenarios.end(),
                                     [&](const Scenario& scenario) { return scenario.name == ToUtf8(row.key); });
    if (!isKnown) scenarios.push_back(OneCollector(row.key));  // two collectors share a key
  }
  return scenarios;
}

}  // namespace faults
