#include "gui/application.h"

#include <windows.h>

#include <atomic>
#include <utility>

namespace qx {

Application& Application::Get() {
  static std::atomic_flag s_flag;
  static std::atomic<Application*> s_made{nullptr};
  if (Application* const made = s_made.load()) return *made;
  while (s_flag.test_and_set())
    Sleep(1);
  static Application s_application;
  s_made = &s_application;
  s_flag.clear();
  return s_application;
}

std::shared_ptr<IServConfig> Application::ProductConfig() {
  const std::lock_guard lock(m_mutex);
  if (!std::exchange(m_isConfigAsked, true)) {
    const ComponentManager manager{{}};
    m_config = ServPlugin<IServConfig>::GetPlugin(&manager);
  }
  return m_config;
}

}  // namespace qx
