#include "core/runtime_failures.h"

#include <windows.h>

#include <csignal>
#include <cstdlib>
#include <exception>

#include "interfaces/crash_handler_api.h"

namespace {

using SignalHandler = void(__cdecl*)(int);

SignalHandler g_previousAbort = SIG_DFL;
std::terminate_handler g_previousTerminate = nullptr;
_purecall_handler g_previousPureCall = nullptr;
_invalid_parameter_handler g_previousInvalidParameter = nullptr;

void __cdecl OnAbort(int) {
  FailUnhandled(CRASH_CODE_ABORT);
}
void OnTerminate() {
  FailUnhandled(CRASH_CODE_TERMINATE);
}
void __cdecl OnPureCall() {
  FailUnhandled(CRASH_CODE_PURE_CALL);
}
void __cdecl OnInvalidParameter(const wchar_t*, const wchar_t*, const wchar_t*, unsigned, uintptr_t) {
  FailUnhandled(CRASH_CODE_INVALID_PARAMETER);
}

// `set` exchanges a hook and returns the one that was there.
template <class Set, class Hook>
void Restore(Set set, Hook ours, Hook previous) {
  const Hook current = set(previous);
  if (current != ours) set(current);
}

}  // namespace

void InstallRuntimeFailureHooks() {
  g_previousAbort = std::signal(SIGABRT, OnAbort);
  g_previousTerminate = std::set_terminate(OnTerminate);
  g_previousPureCall = _set_purecall_handler(OnPureCall);
  g_previousInvalidParameter = _set_invalid_parameter_handler(OnInvalidParameter);
}

void RemoveRuntimeFailureHooks() {
  Restore([](SignalHandler hook) { return std::signal(SIGABRT, hook); }, &OnAbort, g_previousAbort);
  Restore([](std::terminate_handler hook) { return std::set_terminate(hook); }, &OnTerminate, g_previousTerminate);
  Restore([](_purecall_handler hook) { return _set_purecall_handler(hook); }, &OnPureCall, g_previousPureCall);
  Restore([](_invalid_parameter_handler hook) { return _set_invalid_parameter_handler(hook); }, &OnInvalidParameter,
          g_previousInvalidParameter);
}

void FailUnhandled(uint32_t code) {
  if (IsDebuggerPresent()) RaiseException(code, EXCEPTION_NONCONTINUABLE, 0, nullptr);
  // A raised exception would pass every frame of the stack, and some of them (window procedures, remote calls, a
  // foreign library's catch-all) would swallow it.
  CONTEXT context{};
  RtlCaptureContext(&context);
  EXCEPTION_RECORD record{};
  record.ExceptionCode = code;
  record.ExceptionFlags = EXCEPTION_NONCONTINUABLE;
  record.ExceptionAddress = reinterpret_cast<void*>(context.Rip);
  EXCEPTION_POINTERS pointers{&record, &context};
  UnhandledExceptionFilter(&pointers);
  TerminateProcess(GetCurrentProcess(), code);
  std::_Exit(static_cast<int>(code));  // not reached; says so to the compiler
}
