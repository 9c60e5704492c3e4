#include "gui/engine.h"

#include <windows.h>

#include "core/dynamic_library.h"
#include "core/logging.h"

namespace qx::gui {
namespace {

const HtmlEngineApi* Load(const DynamicLibrary& library) {
  constexpr wchar_t kScope[] = L"qx::gui::Engine";
  if (!library) {
    LOG_ERROR(kScope, L"the HTML engine sciter.dll cannot be loaded, error %d", GetLastError());
    return nullptr;
  }
  const auto api = library.Resolve<decltype(&SciterAPI)>("SciterAPI");
  if (api == nullptr) LOG_ERROR(kScope, L"the HTML engine sciter.dll has no export SciterAPI");
  return api == nullptr ? nullptr : api();
}

}  // namespace

const HtmlEngineApi& Engine() {
  static const DynamicLibrary s_library(L"sciter.dll");
  static const HtmlEngineApi* const s_api = Load(s_library);
  if (s_api == nullptr) ExitProcess(static_cast<UINT>(-1));
  return *s_api;
}

}  // namespace qx::gui
