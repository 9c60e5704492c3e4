// What is one for the process in the interactive mode: the bus and the plug-ins.
#pragma once

#include <memory>
#include <mutex>

#include "gui/plugins.h"
#include "gui/pub_sub.h"

namespace qx {

class Application {
 public:
  // Made by the first call, whichever thread that is; it stays until the process ends.
  static Application& Get();

  const std::shared_ptr<PubSub>& Bus() const { return m_bus; }

  // Null when the plug-in cannot be had, which is logged once.
  std::shared_ptr<IServConfig> ProductConfig();

 private:
  const std::shared_ptr<PubSub> m_bus = std::make_shared<PubSub>();
  std::mutex m_mutex;
  std::shared_ptr<IServConfig> m_config;
  bool m_isConfigAsked = false;
};

}  // namespace qx
