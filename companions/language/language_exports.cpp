// The exports of the language manager plug-in.
#include <windows.h>

#include <exception>
#include <memory>

#include "companions/language/catalogue.h"
#include "core/program_path.h"
#include "interfaces/language_manager_api.h"

struct LanguageManager {
  language::Catalogue catalogue;
};

namespace {

constexpr wchar_t kEnglish[] = L"en";

uint32_t Load(const std::wstring& name, TextTable& texts) {
  std::string error;  // there is no log here; the caller logs the number
  return ReadTextTable(OwnModuleFolder() + L"\\language\\" + name + L".json", texts, error);
}

uint32_t Create(const wchar_t* name, LanguageManager** manager) {
  if (!language::IsCatalogueName(name)) return ERROR_INVALID_PARAMETER;
  TextTable texts;
  if (const uint32_t error = Load(name, texts); error != ERROR_SUCCESS) return error;
  TextTable english;
  Load(kEnglish, english);  // without it texts are found by their keys only
  *manager = std::make_unique<LanguageManager>(LanguageManager{{std::move(texts), english}}).release();
  return ERROR_SUCCESS;
}

}  // namespace

int32_t LanguageManagerCreate(const wchar_t* language, LanguageManager** manager) {
  if (manager == nullptr) return ERROR_INVALID_PARAMETER;
  *manager = nullptr;
  if (language == nullptr) return ERROR_INVALID_PARAMETER;
  try {
    return static_cast<int32_t>(Create(language, manager));
  } catch (const std::exception&) {
    return ERROR_OUTOFMEMORY;
  }
}

void LanguageManagerDestroy(LanguageManager* manager) {
  const std::unique_ptr<LanguageManager> owner(manager);
}

int32_t LanguageManagerTranslate(const LanguageManager* manager, const wchar_t* text, wchar_t* buffer,
                                 uint32_t* chars) {
  if (manager == nullptr || text == nullptr || chars == nullptr) return ERROR_INVALID_PARAMETER;
  try {
    const std::optional<std::wstring> found = manager->catalogue.Find(text);
    return static_cast<int32_t>(found ? CopyText(*found, buffer, chars) : ERROR_NOT_FOUND);
  } catch (const std::exception&) {
    return ERROR_OUTOFMEMORY;
  }
}
