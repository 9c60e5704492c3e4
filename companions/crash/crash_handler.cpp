#include "companions/crash/crash_handler.h"

#include <utility>

#include "companions/crash/kernel_file.h"
#include "core/runtime_failures.h"

namespace crash {
namespace {

constexpr DWORD kHeapCorruption = 0xC0000374;
constexpr DWORD kMicrosoftThrow = 0xE06D7363;
constexpr DWORD kGccThrow = 0x20474343;

// Enough for the system's way to the filter and for the filter.
constexpr ULONG kReservedStack = 32 << 10;

// Milliseconds. The full dump gives up by itself before it is given up.
constexpr DWORD kFullLimit = FullDump::kLimit + 2000;
constexpr DWORD kPlainLimit = 10000;
constexpr DWORD kDumpLimit = kFullLimit + kPlainLimit;

std::atomic<CrashHandler*> g_installed{nullptr};

// The run-time library of GCC throws so that nobody's handler means "go on": it then calls std::terminate itself.
bool IsGccThrow(const EXCEPTION_RECORD& record) {
  return record.ExceptionCode == kGccThrow && (record.ExceptionFlags & EXCEPTION_NONCONTINUABLE) == 0;
}

[[noreturn]] void Terminate(uint32_t code) {
  for (;;)
    TerminateProcess(GetCurrentProcess(), code);
}

}  // namespace

CrashHandler::CrashHandler(const std::wstring& folder, const std::wstring& program, std::wstring surplus)
    : m_fullDump(DumpPath(folder, program, GetCurrentProcessId()), std::move(surplus)),
      m_plainDump(DumpPath(KernelPath(folder), program, GetCurrentProcessId(), L"_plain")),
      m_fullThread(m_fullDump),
      m_plainThread(m_plainDump) {}

CrashHandler::~CrashHandler() {
  CrashHandler* self = this;
  if (!g_installed.compare_exchange_strong(self, nullptr)) return;
  if (m_crash.load() != 0) Sleep(kDumpLimit);  // the process is about to end; its threads still need this code
  if (const auto current = SetUnhandledExceptionFilter(m_previous); current != &OnUnhandled) {
    SetUnhandledExceptionFilter(current);
  }
  RemoveVectoredExceptionHandler(m_firstChance);
  RemoveRuntimeFailureHooks();
}

DWORD CrashHandler::Install() {
  for (DumpThread* const thread : {&m_fullThread, &m_plainThread}) {
    if (const DWORD error = thread->Start(); error != ERROR_SUCCESS) return error;
  }
  g_installed = this;
  m_previous = SetUnhandledExceptionFilter(&OnUnhandled);
  m_firstChance = AddVectoredExceptionHandler(TRUE, &OnFirstChance);
  // These hooks are this library's run-time library's. It is the program's too where both share one; where each has its
  // own, the program installs them as well.
  InstallRuntimeFailureHooks();
  ReserveStack();
  return ERROR_SUCCESS;
}

void CrashHandler::ReserveStack() {
  if (g_installed.load() == nullptr) return;
  ULONG size = kReservedStack;
  SetThreadStackGuarantee(&size);  // a thread with too small a stack goes without
}

LONG WINAPI CrashHandler::OnUnhandled(EXCEPTION_POINTERS* exception) {
  if (IsGccThrow(*exception->ExceptionRecord)) return EXCEPTION_CONTINUE_EXECUTION;
  CrashHandler* const handler = g_installed.load();
  if (handler != nullptr) handler->EndProcess(exception);
  return EXCEPTION_CONTINUE_SEARCH;
}

// The system does not show a corrupt heap to the filter of unhandled exceptions.
LONG WINAPI CrashHandler::OnFirstChance(EXCEPTION_POINTERS* exception) {
  if (exception->ExceptionRecord->ExceptionCode != kHeapCorruption) return EXCEPTION_CONTINUE_SEARCH;
  return OnUnhandled(exception);
}

void CrashHandler::EndProcess(EXCEPTION_POINTERS* exception) {
  const uint32_t code = exception->ExceptionRecord->ExceptionCode;
  uint64_t first = 0;
  if (!m_crash.compare_exchange_strong(first, uint64_t{GetCurrentThreadId()} << 32 | code)) EndLaterCrash(first);
  m_crashed = {GetCurrentThreadId(), exception};
  if (!m_fullThread.Write(m_crashed, kFullLimit)) m_plainThread.Write(m_crashed, kPlainLimit);
  // Whoever was there before is told, but does not decide: a process with a dump ends. A Microsoft run-time library's
  // own filter knows C++ exceptions only and would end the process in a way of its own.
  if (m_previous != nullptr && code != kMicrosoftThrow) m_previous(exception);
  Terminate(code);
}

// Another thread crashed while the first one is being dumped: it waits for that. When the thread of the full dump
// itself crashes, as it does when the heap is spoilt, it sees the process to its end, for the first thread may have
// been left suspended. In the thread of the plain dump, and in the first one again, nothing more can be done.
void CrashHandler::EndLaterCrash(uint64_t first) {
  const DWORD thread = GetCurrentThreadId();
  if (thread == m_fullThread.Id()) {
    m_plainThread.Write(m_crashed, kPlainLimit);
  } else if (thread != first >> 32 && thread != m_plainThread.Id()) {
    Sleep(kDumpLimit);
  }
  Terminate(static_cast<uint32_t>(first));
}

}  // namespace crash
