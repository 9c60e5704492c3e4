#include "gui/plugins.h"

#include <windows.h>

#include "core/dynamic_library.h"
#include "core/text_table.h"
#include "interfaces/language_manager_api.h"
#include "interfaces/serv_config_api.h"

namespace qx {
namespace {

// An object of a library; destroyed by the library's own export, before the library is freed.
template <class Object>
struct PluginObject {
  ~PluginObject() {
    if (object != nullptr) destroy(object);
  }
  DynamicLibrary library;
  void (*destroy)(Object*) = nullptr;
  Object* object = nullptr;
};

uint32_t NotLoaded() {
  const DWORD error = GetLastError();
  return error == ERROR_SUCCESS ? ERROR_MOD_NOT_FOUND : error;
}

class LanguagePlugin : public ILanguageManager {
 public:
  uint32_t Create(const std::wstring& language) {
    m_manager.library = DynamicLibrary(L"LanguageManager.dll");
    if (!m_manager.library) return NotLoaded();
    const auto create = m_manager.library.Resolve<decltype(&LanguageManagerCreate)>("LanguageManagerCreate");
    m_manager.destroy = m_manager.library.Resolve<decltype(&LanguageManagerDestroy)>("LanguageManagerDestroy");
    m_translate = m_manager.library.Resolve<decltype(&LanguageManagerTranslate)>("LanguageManagerTranslate");
    if (create == nullptr || m_manager.destroy == nullptr || m_translate == nullptr) return ERROR_PROC_NOT_FOUND;
    return static_cast<uint32_t>(create(language.c_str(), &m_manager.object));
  }
  uint32_t Translate(const std::wstring& text, std::wstring& translation) const override {
    return FetchText(
        [&](wchar_t* buffer, uint32_t* chars) {
          return static_cast<uint32_t>(m_translate(m_manager.object, text.c_str(), buffer, chars));
        },
        translation);
  }

 private:
  PluginObject<LanguageManager> m_manager;
  decltype(&LanguageManagerTranslate) m_translate = nullptr;
};

class ConfigPlugin : public IServConfig {
 public:
  uint32_t Create() {
    m_config.library = DynamicLibrary(L"ServConfig.dll");
    if (!m_config.library) return NotLoaded();
    const auto create = m_config.library.Resolve<decltype(&ServConfigCreate)>("ServConfigCreate");
    m_config.destroy = m_config.library.Resolve<decltype(&ServConfigDestroy)>("ServConfigDestroy");
    m_getText = m_config.library.Resolve<decltype(&ServConfigGetText)>("ServConfigGetText");
    if (create == nullptr || m_config.destroy == nullptr || m_getText == nullptr) return ERROR_PROC_NOT_FOUND;
    return static_cast<uint32_t>(create(&m_config.object));
  }
  uint32_t GetText(const std::wstring& key, std::wstring& text) const override {
    return FetchText(
        [&](wchar_t* buffer, uint32_t* chars) {
          return static_cast<uint32_t>(m_getText(m_config.object, key.c_str(), buffer, chars));
        },
        text);
  }

 private:
  PluginObject<ServConfig> m_config;
  decltype(&ServConfigGetText) m_getText = nullptr;
};

}  // namespace

uint32_t ComponentManager::Create(std::shared_ptr<ILanguageManager>& plugin) const {
  plugin.reset();
  auto created = std::make_shared<LanguagePlugin>();
  const uint32_t error = created->Create(m_language);
  if (error == ERROR_SUCCESS) plugin = std::move(created);
  return error;
}

uint32_t ComponentManager::Create(std::shared_ptr<IServConfig>& plugin) {
  plugin.reset();
  auto created = std::make_shared<ConfigPlugin>();
  const uint32_t error = created->Create();
  if (error == ERROR_SUCCESS) plugin = std::move(created);
  return error;
}

}  // namespace qx
