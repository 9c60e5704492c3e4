// What every collector is: a name, the data that it gathers once, and the operation that gathers them. A new collector
// derives from it, fills m_data in Start, and gets a row in collector_table.cpp.
#pragma once

#include <json/value.h>

#include <atomic>
#include <memory>
#include <string>
#include <utility>

class WMIWrapper;

namespace systeminfo {

class CollectingSettings;

// Whether the run was asked to end. Null: nobody can ask.
inline bool IsCancelled(const std::atomic<bool>* cancel) {
  return cancel != nullptr && cancel->load();
}

class ICollector {
 public:
  // `name` is the settings key that enables the collector and the base name of its file.
  explicit ICollector(std::wstring name) : m_name(std::move(name)) {}
  ICollector(const ICollector&) = delete;
  ICollector& operator=(const ICollector&) = delete;

  // Fills the data, on a thread of the run's own, once. Data left null mean that nothing was collected; failures are
  // logged and leave them null or partial. `settings` and `wmi` are never null, and `wmi` is not kept beyond the call.
  // Another thread may set `*cancel` (null: nobody will) to ask for an early end, with the data gathered so far; that
  // is also how a collector hears that its time is over. One that does not come back is left behind: nothing that it
  // touches, but what it was made with and given here, may depend on anybody who goes on.
  virtual void Start(const std::shared_ptr<CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
                     const std::atomic<bool>* cancel) = 0;
  virtual Json::Value GetData() const { return m_data; }
  virtual std::wstring GetName() const { return m_name; }
  virtual ~ICollector() = default;

  // GetData without the copy: an event log is large.
  const Json::Value& Data() const { return m_data; }

 protected:
  std::wstring m_name;
  Json::Value m_data;
};

}  // namespace systeminfo
