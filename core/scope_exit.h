// Runs a clean-up when its scope ends, by whatever way, unless it was disarmed before.
#pragma once

#include <utility>

template <class Function>
class ScopeExit {
 public:
  explicit ScopeExit(Function function) : m_function(std::move(function)) {}
  ~ScopeExit() {
    if (m_armed) m_function();
  }
  ScopeExit(const ScopeExit&) = delete;
  ScopeExit& operator=(const ScopeExit&) = delete;

  void Disarm() { m_armed = false; }

 private:
  Function m_function;  // must not throw
  bool m_armed = true;
};
