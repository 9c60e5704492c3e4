// The exports of the product configuration plug-in.
#include <windows.h>

#include <exception>
#include <memory>

#include "core/program_path.h"
#include "core/text_table.h"
#include "interfaces/serv_config_api.h"

struct ServConfig {
  TextTable texts;
};

int32_t ServConfigCreate(ServConfig** config) {
  if (config == nullptr) return ERROR_INVALID_PARAMETER;
  *config = nullptr;
  try {
    auto created = std::make_unique<ServConfig>();
    std::string error;  // there is no log here; the caller logs the number
    const uint32_t result = ReadTextTable(OwnModuleFolder() + L"\\ServConfig.json", created->texts, error);
    if (result == ERROR_SUCCESS) *config = created.release();
    return static_cast<int32_t>(result);
  } catch (const std::exception&) {
    return ERROR_OUTOFMEMORY;
  }
}

void ServConfigDestroy(ServConfig* config) {
  const std::unique_ptr<ServConfig> owner(config);
}

int32_t ServConfigGetText(const ServConfig* config, const wchar_t* key, wchar_t* buffer, uint32_t* chars) {
  if (config == nullptr || key == nullptr || chars == nullptr) return ERROR_INVALID_PARAMETER;
  try {
    const auto found = config->texts.find(std::wstring_view(key));
    return static_cast<int32_t>(found == config->texts.end() ? ERROR_NOT_FOUND
                                                             : CopyText(found->second, buffer, chars));
  } catch (const std::exception&) {
    return ERROR_OUTOFMEMORY;
  }
}
