// The one gateway of the collectors to Windows Management Instrumentation: one connection to the local ROOT\CIMV2 for a
// collection run, and WQL queries whose properties come back as JSON values (variant_to_json.h says how). Made, used
// and destroyed on one thread; no collector may keep it beyond the run. Failures are logged here and returned as
// values.
#pragma once

#include <windows.h>

#include <json/value.h>
#include <wbemidl.h>

#include <atomic>
#include <functional>
#include <map>
#include <string>
#include <vector>

#include "core/com.h"

class WMIWrapper {
 public:
  using Names = std::vector<std::wstring>;          // of the wanted properties
  using Row = std::map<std::wstring, Json::Value>;  // by property name; operator[] of a missing name is JSON null
  using Rows = std::vector<Row>;
  using Table = std::vector<std::vector<Json::Value>>;  // values in the order of the names

  // How Init sets the security of the process. A process does that once and never goes back, so tests hand in their
  // own.
  using InitializeSecurity = decltype(&CoInitializeSecurity);

  explicit WMIWrapper(InitializeSecurity initializeSecurity = &CoInitializeSecurity)
      : m_initializeSecurity(initializeSecurity) {}

  // Queries go to `services`, and Init is not called.
  explicit WMIWrapper(ComPtr<IWbemServices> services) : m_services(std::move(services)) {}

  // Leaves COM once, whether Init was called and succeeded or not.
  ~WMIWrapper();
  WMIWrapper(const WMIWrapper&) = delete;
  WMIWrapper& operator=(const WMIWrapper&) = delete;

  // Enters the multithreaded apartment, sets the security of the process and connects. 0 on success, 1 on failure, also
  // when the process had set its security before; every query fails then.
  int Init();

  // From now on a query that waits for WMI is given up, as failed, soon after `stop` was set; the rows that came before
  // are kept. `stop` outlives the wrapper.
  void StopWaitingWhen(const std::atomic<bool>& stop) { m_stop = &stop; }

  // The three forms return 0 on success, also when nothing matched, and 1 when the query failed. A failure on the way
  // keeps the rows that came before it. A property that cannot be read is left out of its row, so a row of a table may
  // be shorter than `names`.
  int ExecuteQuery(const std::wstring& query, const Names& names, Row& row);      // the first instance only
  int ExecuteQuery(const std::wstring& query, const Names& names, Rows& rows);    // appends one row for each instance
  int ExecuteQuery(const std::wstring& query, const Names& names, Table& table);  // likewise

  // Those of `names` that the class has on this system: not every version has them all. All of them when the class
  // cannot be asked.
  Names PropertiesOf(const std::wstring& className, const Names& names);

 private:
  bool Connect();
  HRESULT Next(IEnumWbemClassObject& instances, ComPtr<IWbemClassObject>& instance, ULONG& returned) const;

  using InstanceVisitor = std::function<void(IWbemClassObject& instance)>;
  int VisitInstances(const std::wstring& query, bool onlyFirst, const InstanceVisitor& visit);

  InitializeSecurity m_initializeSecurity = &CoInitializeSecurity;
  const std::atomic<bool>* m_stop = nullptr;
  ComPtr<IWbemLocator> m_locator;
  ComPtr<IWbemServices> m_services;
};

// The name of a WMI status code for log lines; "Invalid return code" for one that is not known.
const wchar_t* WbemErrorName(HRESULT code);
