#include "monitoring/performance_counter.h"

#include <utility>

#include "core/logging.h"

namespace st::monitoring {

std::shared_ptr<PerformanceCounter> PerformanceCounter::Create(const Json::Value& json,
                                                               const CounterQueryMaker& makeQuery) {
  std::optional<CounterSettings> settings = ReadCounter(json, LogNote);
  if (!settings) return nullptr;
  return std::make_shared<PerformanceCounter>(std::move(*settings), makeQuery());
}

PerformanceCounter::PerformanceCounter(CounterSettings settings, std::unique_ptr<CounterQuery> query)
    : m_settings(std::move(settings)), m_query(std::move(query)) {
  Init();
}

bool PerformanceCounter::Init() {
  constexpr wchar_t kFunction[] = L"st::monitoring::PerformanceCounter::Init";
  if (const int32_t status = m_query->Open(); status != 0) {
    LOG_ERROR(kFunction, L"PdhOpenQuery %d", status);
    return false;
  }
  if (const int32_t status = m_query->AddCounter(m_settings.query); status != 0) {
    LOG_ERROR(kFunction, L"PdhAddCounter %d", status);
    return false;
  }
  return true;
}

bool PerformanceCounter::CollectQueryData() {
  return m_query->Collect() == 0;
}

bool PerformanceCounter::GetCounterValue(double& value) {
  double fresh = 0;
  if (const int32_t status = m_query->GetValue(fresh); status != 0) {
    LOG_ERROR(L"st::monitoring::PerformanceCounter::GetCounterValue", L"PdhGetFormattedCounterValue returned %d",
              status);
    return false;
  }
  value = fresh;
  return true;
}

}  // namespace st::monitoring
