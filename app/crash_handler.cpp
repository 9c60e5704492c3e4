#include "app/crash_handler.h"

#include "core/logging.h"
#include "core/runtime_failures.h"
#include "core/scope_trace.h"
#include "interfaces/crash_handler_api.h"

DynamicLibrary InitQxch() {
  constexpr wchar_t kScope[] = L"InitQxch";
  const logging::ScopeTrace trace(kScope);
  DynamicLibrary library(L"qxch.dll");
  if (!library) {
    LOG_ERROR(kScope, L"error loading qxch dll %d", GetLastError());
    return {};
  }
  const auto enable = library.Resolve<decltype(&EnableCrashHandler)>("EnableCrashHandler");
  if (enable == nullptr) {
    LOG_ERROR(kScope, L"cannot get enable crash handler func");
    return {};
  }
  if (const int32_t result = enable(0, nullptr, nullptr); result != 0) {
    LOG_ERROR(kScope, L"error initializing qxch %d", result);
    return {};
  }
  InstallRuntimeFailureHooks();  // the library cannot reach this program's own run-time library
  return library;
}
