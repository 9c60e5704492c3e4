// The table's calls as the program makes them: each has its import pointer here, which leads to a function that asks
// the fault layer and then fails or calls the system's own. An import pointer that an object file defines is not taken
// from the system's import library.
#include <windows.h>
// windows.h has to come first.
#include <bcrypt.h>
#include <dbghelp.h>
#include <iphlpapi.h>
#include <mmsystem.h>
#include <mscat.h>
#include <ole2.h>
#include <pdh.h>
#include <sddl.h>
#include <shlobj.h>
#include <softpub.h>
#include <wincrypt.h>
#include <winhttp.h>
#include <winternl.h>
#include <wintrust.h>

#include <string_view>
#include <tuple>
#include <type_traits>

#include "tests/faults/fault_layer.h"
#include "tests/faults/faulty_wmi.h"

namespace faults {
namespace {

template <class Result>
Result Failure(FailsAs failsAs, uint32_t error) {
  if (failsAs <= FailsAs::kInvalidHandle) SetLastError(error);
  const bool isZero = failsAs == FailsAs::kFalse || failsAs == FailsAs::kNothing;
  const uint32_t code = failsAs == FailsAs::kHresult ? static_cast<uint32_t>(HRESULT_FROM_WIN32(error)) : error;
  if constexpr (std::is_pointer_v<Result>) {
    return isZero ? nullptr : reinterpret_cast<Result>(INVALID_HANDLE_VALUE);
  } else {
    if (isZero) return Result{};
    return static_cast<Result>(failsAs == FailsAs::kInvalidHandle ? INVALID_FILE_ATTRIBUTES : code);
  }
}

// What has to work for anything to be told: the logging library.
template <size_t kRow, class... Arguments>
bool IsSpared([[maybe_unused]] const std::tuple<Arguments...>& arguments) {
  if constexpr (kRow == row::LoadLibraryExW_) {
    return std::wstring_view(std::get<0>(arguments)).ends_with(L"\\log.dll");
  } else if constexpr (kRow == row::GetProcAddress_) {
    return std::string_view(std::get<1>(arguments)).starts_with("Log");
  } else {
    return false;
  }
}

FARPROC CountedCall(FARPROC found, const char* name);

// What the system gave, or what stands in its place.
template <size_t kRow, class Function, class... Arguments>
auto CallSystem(Function real, Arguments... arguments) {
  if constexpr (kRow == row::CoCreateInstance_) {
    const HRESULT status = real(arguments...);
    return WrapLocator(status, arguments...);
  } else if constexpr (kRow == row::CoSetProxyBlanket_) {
    const auto first = [&](IUnknown* proxy, auto... rest) { return real(RealServices(proxy), rest...); };
    return first(arguments...);
  } else if constexpr (kRow == row::CoInitializeSecurity_) {
    // Once in a process; a walk has many runs in one.
    const HRESULT status = real(arguments...);
    return status == RPC_E_TOO_LATE ? S_OK : status;
  } else if constexpr (kRow == row::GetProcAddress_) {
    return CountedCall(real(arguments...), std::get<1>(std::tuple(arguments...)));
  } else {
    return real(arguments...);
  }
}

template <class Function>
struct Call;

template <class Result, class... Arguments>
struct Call<Result(WINAPI*)(Arguments...)> {
  using ResultType = Result;

  template <size_t kRow>
  static Result WINAPI Make(Arguments... arguments) {
    const auto real = reinterpret_cast<Result(WINAPI*)(Arguments...)>(RealCall(kRow));
    if (!IsSpared<kRow>(std::tuple(arguments...))) {
      if (const uint32_t error = ErrorOfCall(kRow)) return Failure<Result>(kCalls[kRow].failsAs, error);
    }
    return CallSystem<kRow>(real, arguments...);
  }
};

#define ST_NO_CALL(...)

// Functions that the program finds by name are found here.
FARPROC CountedCall(FARPROC found, const char* name) {
#define ST_LOADED_CALL(call, ...)                                                                          \
  if (found != nullptr && std::string_view(name) == #call) {                                               \
    return reinterpret_cast<FARPROC>(reinterpret_cast<void*>(&Call<decltype(&call)>::Make<row::call##_>)); \
  }
  ST_FAULT_TABLE(ST_NO_CALL, ST_NO_CALL, ST_LOADED_CALL, ST_NO_CALL)
#undef ST_LOADED_CALL
  return found;
}

}  // namespace
}  // namespace faults

// NOLINTBEGIN(bugprone-reserved-identifier,bugprone-macro-parentheses): the linker's own name for an import pointer
#define ST_IMPORTED_CALL(name, ...)                                                          \
  extern "C" {                                                                               \
  decltype(&name) __imp_##name = &faults::Call<decltype(&name)>::Make<faults::row::name##_>; \
  }
#define ST_PLAIN_CALL(name, library, failsAs, errors, parameters, arguments)          \
  extern "C" auto WINAPI name parameters->faults::Call<decltype(&name)>::ResultType { \
    return faults::Call<decltype(&name)>::Make<faults::row::name##_> arguments;       \
  }
ST_FAULT_TABLE(ST_IMPORTED_CALL, ST_PLAIN_CALL, ST_NO_CALL, ST_NO_CALL)
// NOLINTEND(bugprone-reserved-identifier,bugprone-macro-parentheses)
