// Brackets a function in the log: "-> name()" when it begins, "<- name() [milliseconds]" when it ends, by an exception
// too. The lines of nested scopes are indented by the logging library. A traced function opens one as its first action.
#pragma once

#include <cstddef>
#include <cstdint>

namespace logging {

class ScopeTrace {
 public:
  explicit ScopeTrace(const wchar_t* function);
  ~ScopeTrace();
  ScopeTrace(const ScopeTrace&) = delete;
  ScopeTrace& operator=(const ScopeTrace&) = delete;

  static constexpr size_t kLongestName = 260;  // characters; a longer name is cut

 private:
  uint32_t m_start;  // milliseconds of the system timer
  wchar_t m_displayName[kLongestName + 1];
  wchar_t m_name[kLongestName + 1];
};

}  // namespace logging
