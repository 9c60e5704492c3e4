// Counters that read what a test has written down, in the place of the system's.
#pragma once

#include <map>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "monitoring/counter_query.h"

namespace st::monitoring {

// By counter path: what each collection yields, in order; the last reading repeats. Nothing: the collection fails.
using CounterScripts = std::map<std::wstring, std::vector<std::optional<double>>>;

class ScriptedCounter : public CounterQuery {
 public:
  explicit ScriptedCounter(const CounterScripts& scripts) : m_scripts(scripts) {}

  int32_t Open() override { return 0; }
  int32_t AddCounter(const std::wstring& path) override {
    const auto script = m_scripts.find(path);
    if (script == m_scripts.end()) return kNoCounter;
    m_script = script->second;
    return 0;
  }
  int32_t Collect() override {
    const std::lock_guard lock(m_mutex);
    if (m_script.empty()) return kNoData;
    m_reading = m_script.front();
    if (m_script.size() > 1) m_script.erase(m_script.begin());
    return m_reading ? 0 : kNoData;
  }
  int32_t GetValue(double& value) override {
    const std::lock_guard lock(m_mutex);
    if (!m_reading) return kInvalidHandle;
    value = *m_reading;
    return 0;
  }

  // The system's numbers.
  static constexpr int32_t kNoCounter = static_cast<int32_t>(0xC0000BB9);
  static constexpr int32_t kNoData = static_cast<int32_t>(0x800007D5);
  static constexpr int32_t kInvalidHandle = static_cast<int32_t>(0xC0000BBC);

 private:
  const CounterScripts& m_scripts;
  std::mutex m_mutex;
  std::vector<std::optional<double>> m_script;
  std::optional<double> m_reading;
};

}  // namespace st::monitoring
