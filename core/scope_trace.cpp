#include "core/scope_trace.h"

#include <algorithm>
#include <cwchar>
#include <string_view>

#include "core/logging.h"

namespace logging {
namespace {

// Copies as much of `text` behind the first `used` characters of a name as fits; returns the new length.
size_t Append(wchar_t (&name)[ScopeTrace::kLongestName + 1], size_t used, std::wstring_view text) {
  const size_t count = std::min(text.size(), ScopeTrace::kLongestName - used);
  std::wmemcpy(name + used, text.data(), count);
  name[used + count] = L'\0';
  return used + count;
}

}  // namespace

ScopeTrace::ScopeTrace(const wchar_t* function) : m_start(GetTickCount()) {
  Append(m_name, 0, function);
  Append(m_displayName, Append(m_displayName, 0, function), L"()");
  if (IsEnabled()) Write(+1, Level::kTrace, m_name, L"-> %s", &m_displayName[0]);
}

ScopeTrace::~ScopeTrace() {
  const uint32_t elapsed = GetTickCount() - m_start;  // unsigned: right across the timer's wrap
  if (IsEnabled()) Write(-1, Level::kTrace, m_name, L"<- %s [%d]", &m_displayName[0], elapsed);
}

}  // namespace logging
