// Runs the collectors that the settings enable, one after another, and writes what each gathers as one JSON file, named
// after it, into a fresh output folder. They work on a thread of the run's own while the caller waits, so that nothing
// that a collector does, neither an exception nor never coming back, ends the run or reaches the caller. One object
// serves one run.
#pragma once

#include <json/value.h>

#include <atomic>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "systeminfo/collecting_settings.h"
#include "systeminfo/collection_manifest.h"
#include "systeminfo/collector.h"
#include "systeminfo/collector_thread.h"

namespace systeminfo {

// The result of a run. The numbers are what the collection driver goes by.
enum RunCode : int {
  kRunDone = 0,
  kRunCancelled = 2,
  kRunNoOutputFolder = 4,  // also when it exists already, or the settings name none
  kRunNoWmi = 5,
};

// Called on the caller's thread after each collector: (1, n) to (n, n).
using ProgressCallback = std::function<void(int current, int total)>;

struct PlannedCollector {
  std::shared_ptr<ICollector> collector;
  std::wstring className;  // for the manifest
};
using CollectorList = std::vector<PlannedCollector>;

class DataCollectorImpl {
 public:
  // `settings` is not null. A collector may take as long as they say; then it has the grace of `limits` to end with
  // what it has gathered, and is left behind when it does not.
  explicit DataCollectorImpl(std::shared_ptr<CollectingSettings> settings, WmiMaker connect = &ConnectToWmi,
                             const TimeLimits& limits = {});

  // Runs all enabled collectors. `cancel` may be null, and another thread may set it; `progress` may be empty.
  int CollectAll(const std::atomic<bool>* cancel, const ProgressCallback& progress);

  // The enabled collectors in the order of the table. Settings keys that enable nothing are logged as warnings.
  CollectorList BuildCollectors() const;

  bool IsCollectorEnabled(std::wstring_view key) const;

  // "output_folder" of the settings; empty, and logged, when it is absent or no string.
  std::wstring GetOutputFolder() const;

  // True when this call created the folder. One that is there already is refused on purpose: every run gets a fresh
  // one.
  bool CreateOutputFolder() const;

  // CollectAll for a given list. The WMI connection is started even for an empty one.
  int RunCollectors(const std::atomic<bool>* cancel, const ProgressCallback& progress, const CollectorList& collectors);

  // What came of each collector that the last run started, in their order.
  const std::vector<CollectorOutcome>& Outcomes() const { return m_outcomes; }

  // Writes indented or one-line JSON, replacing an older file; there is never half a file under `path`. Returns 0 or
  // the Windows error number, which is logged; `bytes` receives the size of the file.
  static unsigned long WriteJsonFile(std::wstring_view path, const Json::Value& value, bool pretty, uint64_t& bytes);

 private:
  std::shared_ptr<CollectingSettings> m_settings;
  const WmiMaker m_connect;
  TimeLimits m_limits;
  std::vector<CollectorOutcome> m_outcomes;
};

}  // namespace systeminfo
