#include <windows.h>

#include <pdh.h>
#include <pdhmsg.h>

#include "core/scoped.h"
#include "monitoring/counter_query.h"

namespace st::monitoring {
namespace {

struct PdhQueryTraits {
  using Type = PDH_HQUERY;
  static bool IsValid(PDH_HQUERY query) { return query != nullptr && query != INVALID_HANDLE_VALUE; }
  static void Close(PDH_HQUERY query) { PdhCloseQuery(query); }
};
using ScopedPdhQuery = Scoped<PdhQueryTraits>;

class PdhQuery : public CounterQuery {
 public:
  int32_t Open() override {
    PDH_HQUERY query = INVALID_HANDLE_VALUE;
    const int32_t status = static_cast<int32_t>(PdhOpenQueryW(nullptr, 0, &query));
    m_query.Reset(status == ERROR_SUCCESS ? query : INVALID_HANDLE_VALUE);
    return status;
  }
  int32_t AddCounter(const std::wstring& path) override {
    if (!m_query) return kNoQuery;
    return static_cast<int32_t>(PdhAddCounterW(m_query.Get(), path.c_str(), 0, &m_counter));
  }
  int32_t Collect() override { return m_query ? static_cast<int32_t>(PdhCollectQueryData(m_query.Get())) : kNoQuery; }
  int32_t GetValue(double& value) override {
    if (m_counter == INVALID_HANDLE_VALUE) return kNoQuery;
    PDH_FMT_COUNTERVALUE formatted{};
    const PDH_STATUS status = PdhGetFormattedCounterValue(m_counter, PDH_FMT_DOUBLE, nullptr, &formatted);
    if (status == ERROR_SUCCESS) value = formatted.doubleValue;
    return static_cast<int32_t>(status);
  }

 private:
  // The system takes a handle for an address: one that is none is never handed over.
  static constexpr int32_t kNoQuery = static_cast<int32_t>(PDH_INVALID_HANDLE);

  ScopedPdhQuery m_query{INVALID_HANDLE_VALUE};
  PDH_HCOUNTER m_counter = INVALID_HANDLE_VALUE;  // belongs to the query
};

}  // namespace

std::unique_ptr<CounterQuery> MakePdhQuery() {
  return std::make_unique<PdhQuery>();
}

}  // namespace st::monitoring
