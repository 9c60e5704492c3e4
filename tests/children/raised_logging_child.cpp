// Raises the product's logging as the interactive mode does, says so on its standard output, and then ends as it is
// told:  raised_logging_child FOLDER crash | abort | wait | end        FOLDER holds a "Logger.xml"
#include <windows.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "core/runtime_failures.h"
#include "stutil/product_logging.h"
#include "stutil/product_logging_guard.h"

// As the crash handler does: the system's own handling could start a debugger.
static LONG WINAPI EndProcess(EXCEPTION_POINTERS* exception) {
  TerminateProcess(GetCurrentProcess(), exception->ExceptionRecord->ExceptionCode);
  return EXCEPTION_EXECUTE_HANDLER;
}

int wmain(int argc, wchar_t** argv) {
  if (argc != 3) return 2;
  SetUnhandledExceptionFilter(&EndProcess);
  InstallRuntimeFailureHooks();
  const stutil::ProductLogging logging(argv[1]);
  const stutil::ProductLoggingGuard guard([&logging] { logging.Restore(); });
  std::printf("%d\n", logging.Activate() ? 1 : 0);
  std::fflush(stdout);
  const std::wstring end = argv[2];
  if (end == L"crash") RaiseException(EXCEPTION_ACCESS_VIOLATION, EXCEPTION_NONCONTINUABLE, 0, nullptr);
  if (end == L"abort") std::abort();
  if (end == L"wait") Sleep(INFINITE);
  return 0;
}
