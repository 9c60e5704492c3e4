// The product's plug-ins as the interactive mode uses them, and the component manager that makes them: it loads a
// plug-in's library and calls its create and destroy exports.
#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "core/logging.h"

namespace qx {

// Texts in the language of the page. Any thread may call.
class ILanguageManager {
 public:
  virtual ~ILanguageManager() = default;
  // 0 or a Windows error number.
  virtual uint32_t Translate(const std::wstring& text, std::wstring& translation) const = 0;
};

// What the installed product is. Any thread may call.
class IServConfig {
 public:
  virtual ~IServConfig() = default;
  virtual uint32_t GetText(const std::wstring& key, std::wstring& text) const = 0;
};

class ComponentManager {
 public:
  // `language` names the catalogue of texts.
  explicit ComponentManager(std::wstring language) : m_language(std::move(language)) {}

  // 0 or a Windows error number; `plugin` is null then. The plug-in keeps its library loaded.
  uint32_t Create(std::shared_ptr<ILanguageManager>& plugin) const;
  static uint32_t Create(std::shared_ptr<IServConfig>& plugin);

 private:
  std::wstring m_language;
};

// What the log calls a plug-in.
template <class Plugin>
struct PluginName;
template <>
struct PluginName<ILanguageManager> {
  static constexpr wchar_t kName[] = L"LanguageManager";
  static constexpr wchar_t kScope[] = L"ServPlugin<class ILanguageManager>::GetPlugin";
};
template <>
struct PluginName<IServConfig> {
  static constexpr wchar_t kName[] = L"ServConfig";
  static constexpr wchar_t kScope[] = L"ServPlugin<class IServConfig>::GetPlugin";
};

// Gets a plug-in, or logs why there is none and returns null.
template <class Plugin>
class ServPlugin {
 public:
  static std::shared_ptr<Plugin> GetPlugin(const ComponentManager* manager) {
    using Name = PluginName<Plugin>;
    if (manager == nullptr) {
      LOG_ERROR(Name::kScope, L"Null component manager");
      return nullptr;
    }
    std::shared_ptr<Plugin> plugin;
    if (const uint32_t error = manager->Create(plugin); error != 0) {
      LOG_ERROR(Name::kScope, L"Error %d getting plugin \"%s\"", error, Name::kName);
      return nullptr;
    }
    return plugin;
  }
};

}  // namespace qx
