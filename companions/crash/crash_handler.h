// What happens between an unhandled exception and the end of the process: one dump, the filter that was there before,
// the exception's code as the exit code. Once for a process, whatever goes wrong meanwhile.
#pragma once

#include <windows.h>

#include <atomic>
#include <cstdint>
#include <string>

#include "companions/crash/dump_thread.h"
#include "companions/crash/full_dump.h"
#include "companions/crash/plain_dump.h"

namespace crash {

class CrashHandler {
 public:
  // `folder` is an ExtendedPath; `surplus` the path of a dump that goes when there is a new one, or empty.
  CrashHandler(const std::wstring& folder, const std::wstring& program, std::wstring surplus);

  // Puts back what was there before. Safe under the loader lock.
  ~CrashHandler();
  CrashHandler(const CrashHandler&) = delete;
  CrashHandler& operator=(const CrashHandler&) = delete;

  // 0 or a Windows error number. At most one handler of a process is installed at a time.
  DWORD Install();

  // While a handler is installed: keeps some stack of the calling thread back, on which an overflow can be handled.
  static void ReserveStack();

 private:
  static LONG WINAPI OnUnhandled(EXCEPTION_POINTERS* exception);
  static LONG WINAPI OnFirstChance(EXCEPTION_POINTERS* exception);
  [[noreturn]] void EndProcess(EXCEPTION_POINTERS* exception);
  [[noreturn]] void EndLaterCrash(uint64_t first);

  FullDump m_fullDump;
  PlainDump m_plainDump;
  DumpThread m_fullThread;
  DumpThread m_plainThread;  // for when that one fails
  CrashedThread m_crashed;   // of the first crash
  LPTOP_LEVEL_EXCEPTION_FILTER m_previous = nullptr;
  void* m_firstChance = nullptr;
  std::atomic<uint64_t> m_crash{0};  // thread id and exception code of the first crash; 0: none yet
};

}  // namespace crash
