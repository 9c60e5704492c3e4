#include "app/instance.h"

#include "core/logging.h"
#include "core/scope_trace.h"

SingleInstance CheckSingleInstance(const wchar_t* eventName) {
  constexpr wchar_t kScope[] = L"CheckSingleInstance";
  const logging::ScopeTrace trace(kScope);
  constexpr BOOL kManualReset = TRUE;
  constexpr BOOL kNotSignalled = FALSE;
  SetLastError(ERROR_SUCCESS);
  KernelHandle event(CreateEventW(nullptr, kManualReset, kNotSignalled, eventName));
  const DWORD error = GetLastError();
  if (!event) {
    LOG_ERROR(kScope, L"error creating event %d", error);
    return {};
  }
  if (error == ERROR_ALREADY_EXISTS) {
    LOG_TRACE(kScope, L"An instance already exists");
    return {};
  }
  return {std::move(event), true};
}
