// Switches the crash handler on and fails in the way that its arguments say.
//   crash_child LIBRARY CAUSE [own-hooks] [second-thread]
// Before it fails it writes the id of the thread that will into "thread.txt" beside the library. It ends by itself with
// 90 to 99 when something is not as it should be.
#include <windows.h>

#include <tlhelp32.h>

#include <algorithm>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <stdexcept>
#include <string>
#include <string_view>
#include <thread>

#include "core/dynamic_library.h"
#include "core/files.h"
#include "core/runtime_failures.h"
#include "interfaces/crash_handler_api.h"

// Not in the unnamed namespace: of types that nobody else can derive from the compiler knows every implementation, and
// leaves the one out that cannot be called.
namespace half_made {

struct Base;
Base* volatile g_object = nullptr;

struct Base {
  // The object is no more than a Base while this runs.
  Base() {
    g_object = this;
    g_object->Pure();  // NOLINT(clang-analyzer-cplusplus.PureVirtualCall): this is what is wanted
  }
  virtual ~Base() = default;
  virtual void Pure() = 0;
};

struct Derived : Base {
  void Pure() override {}
};

}  // namespace half_made

namespace {

constexpr int kNotEnabled = 90;
constexpr int kUnknownCause = 91;
constexpr int kSurvived = 92;
constexpr int kNotRestored = 93;

std::wstring g_library;

std::wstring Beside(const wchar_t* name) {
  return g_library.substr(0, g_library.find_last_of(L'\\') + 1) + name;
}

void AccessViolation() {
  volatile int* volatile nowhere = reinterpret_cast<volatile int*>(8);
  *nowhere = 1;
}

void UncaughtException() {
  throw std::runtime_error("nobody catches this");
}

void ThrowOutOfNoexcept() noexcept {  // NOLINT(bugprone-exception-escape): this is what is wanted
  UncaughtException();                // cppcheck-suppress throwInNoexceptFunction ; likewise
}

void PureVirtualCall() {
  const half_made::Derived derived;
}

// The hooks are called as the run-time library calls them: the shared one of a GCC build never does.
void RuntimePureCall() {
  _set_purecall_handler(nullptr)();
}

void InvalidParameter() {
  _set_invalid_parameter_handler(nullptr)(nullptr, nullptr, nullptr, 0, 0);
}

// Frames that the compiler cannot take away. Ends when `left` bytes of the stack remain.
int Recurse(size_t left, void (*then)()) {
  volatile char frame[256];
  ULONG_PTR low = 0, high = 0;
  GetCurrentThreadStackLimits(&low, &high);
  frame[0] = 1;
  if (left != 0 && reinterpret_cast<ULONG_PTR>(&frame[0]) - low < left) {
    then();
    return frame[0];
  }
  return Recurse(left, then) + frame[0];
}

void StackOverflow() {
  Recurse(0, nullptr);
}

void OverflowRaised() {
  constexpr size_t kLeft = 24 << 10;  // less than the handler keeps back for itself
  Recurse(kLeft, [] { RaiseException(EXCEPTION_STACK_OVERFLOW, 0, 0, nullptr); });
}

// Writes over a free block, its neighbours and what the heap keeps between them.
void SpoiltHeap() {
  constexpr size_t kBlock = 512, kBlocks = 64;
  char* blocks[kBlocks];
  for (char*& block : blocks)
    block = static_cast<char*>(HeapAlloc(GetProcessHeap(), 0, kBlock));
  for (size_t i = 0; i < kBlocks; i += 2)
    HeapFree(GetProcessHeap(), 0, blocks[i]);
  for (size_t i = 1; i + 1 < kBlocks; i += 2)
    std::memset(blocks[i], 0xFE, kBlock + 64);
  AccessViolation();
}

// Nothing of the heap's own administration is left.
void WreckedHeap() {
  std::memset(GetProcessHeap(), 0xFE, 4096);
  AccessViolation();
}

void HeapCorruptionReported() {
  constexpr DWORD kHeapCorruption = 0xC0000374;
  RaiseException(kHeapCorruption, EXCEPTION_NONCONTINUABLE, 0, nullptr);
}

void HeldHeap() {
  HeapLock(GetProcessHeap());
  AccessViolation();
}

void TwoThreadsAtOnce() {
  const KernelHandle go(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  const auto crash = [&go] {
    WaitForSingleObject(go.Get(), INFINITE);
    AccessViolation();
  };
  std::thread first(crash), second(crash);
  SetEvent(go.Get());
  first.join();
  second.join();
}

LONG WINAPI EarlierFilter(EXCEPTION_POINTERS*) {
  WriteWholeFile(Beside(L"earlier_filter.txt"), "called");
  return EXCEPTION_CONTINUE_EXECUTION;  // not to be believed
}

DWORD ThreadCount() {
  DWORD count = 0;
  const KernelHandle snapshot(CreateToolhelp32Snapshot(TH32CS_SNAPTHREAD, 0));
  THREADENTRY32 entry{};
  entry.dwSize = sizeof entry;
  for (BOOL more = Thread32First(snapshot.Get(), &entry); more; more = Thread32Next(snapshot.Get(), &entry)) {
    if (entry.th32OwnerProcessID == GetCurrentProcessId()) ++count;
  }
  return count;
}

bool Enable(const DynamicLibrary& library) {
  const auto enable = library.Resolve<decltype(&EnableCrashHandler)>("EnableCrashHandler");
  return enable != nullptr && enable(0, nullptr, nullptr) == 0 && enable(0, nullptr, nullptr) == 0;
}

// Loads, enables and frees the library over and over: each time the earlier filter is back, the library is out of
// memory and its thread has ended.
int LoadAndFree() {
  constexpr int kTimes = 20;
  SetUnhandledExceptionFilter(&EarlierFilter);
  const DWORD threads = ThreadCount();
  for (int i = 0; i < kTimes; ++i) {
    if (!Enable(DynamicLibrary(g_library.c_str()))) return kNotEnabled;
    if (GetModuleHandleW(g_library.c_str()) != nullptr) return kNotRestored;
    if (SetUnhandledExceptionFilter(&EarlierFilter) != &EarlierFilter) return kNotRestored;
    if (std::signal(SIGABRT, SIG_DFL) != SIG_DFL) return kNotRestored;
  }
  return ThreadCount() == threads ? 0 : kNotRestored;
}

struct Cause {
  std::wstring_view name;
  void (*run)();
};

constexpr Cause kCauses[] = {
    {L"access-violation", &AccessViolation},
    {L"abort", &std::abort},
    {L"terminate", &std::terminate},
    {L"uncaught-exception", &UncaughtException},
    {L"noexcept", &ThrowOutOfNoexcept},
    {L"pure-virtual-call", &PureVirtualCall},
    {L"runtime-pure-call", &RuntimePureCall},
    {L"invalid-parameter", &InvalidParameter},
    {L"stack-overflow", &StackOverflow},
    {L"overflow-raised", &OverflowRaised},
    {L"spoilt-heap", &SpoiltHeap},
    {L"wrecked-heap", &WreckedHeap},
    {L"heap-corruption", &HeapCorruptionReported},
    {L"held-heap", &HeldHeap},
    {L"two-threads", &TwoThreadsAtOnce},
    {L"earlier-filter", &AccessViolation},
};

const Cause* FindCause(std::wstring_view name) {
  for (const Cause& cause : kCauses) {
    if (cause.name == name) return &cause;
  }
  return nullptr;
}

void RunCause(const Cause& cause) {
  WriteWholeFile(Beside(L"thread.txt"), std::to_string(GetCurrentThreadId()));
  cause.run();
}

}  // namespace

int wmain(int count, wchar_t** arguments) {
  if (count < 3) return kUnknownCause;
  g_library = arguments[1];
  const std::wstring_view name = arguments[2];
  if (name == L"load-and-free") return LoadAndFree();
  const Cause* const cause = FindCause(name);
  if (cause == nullptr) return kUnknownCause;
  const auto has = [&](std::wstring_view word) {
    return std::find(arguments + 3, arguments + count, word) != arguments + count;
  };

  if (name == L"earlier-filter") SetUnhandledExceptionFilter(&EarlierFilter);
  const DynamicLibrary library(g_library.c_str());
  if (!Enable(library)) return kNotEnabled;
  if (has(L"own-hooks")) InstallRuntimeFailureHooks();
  if (has(L"second-thread")) {
    std::thread([cause] { RunCause(*cause); }).join();
  } else {
    RunCause(*cause);
  }
  return kSurvived;
}
