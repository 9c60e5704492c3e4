// The program's entry point. The exit code is always 0, unless the interactive mode finds no HTML engine; outcomes are
// told in the log only.
#include <windows.h>

#include <shellapi.h>

#include <exception>
#include <memory>

#include "app/command_line.h"
#include "app/crash_handler.h"
#include "app/instance.h"
#include "app/modes.h"
#include "app/options.h"
#include "core/abandoned_threads.h"
#include "core/dynamic_library.h"
#include "core/logger_config.h"
#include "core/logging.h"
#include "core/scope_trace.h"
#include "core/scoped.h"
#include "stutil/product_logging.h"

namespace {

constexpr wchar_t kScope[] = L"wWinMain";

// `commandLine` is what follows the program's name. The system splits its first element by the rules for a program's
// name: a quote counts only at the element's beginning. For an empty line it makes up the program's path.
ArgumentMap ReadArguments(const wchar_t* commandLine) {
  int count = 0;
  const LocalMemory<wchar_t*> elements(CommandLineToArgvW(commandLine, &count));
  if (!elements) {
    LOG_ERROR(kScope, L"error splitting the command line %d", GetLastError());
    return {};
  }
  if (*commandLine != L'\0') {
    for (const std::wstring& warning : CommandLineWarnings(count, elements.Get())) {
      LOG_WARNING(kScope, L"%s", warning.c_str());
    }
  }
  return ParseCommandLine(count, elements.Get());
}

void RunMode(const wchar_t* commandLine) {
  const ArgumentMap arguments = ReadArguments(commandLine);
  switch (SelectMode(arguments)) {
    case Mode::kNoGui:
      return NoGui(arguments);
    case Mode::kMonitoring:
      return Testing();
    case Mode::kGui:
      return WithGui(arguments);
  }
}

// The order is kept: crash handler, instance, command line, mode; released in the opposite order.
void Run(const wchar_t* commandLine) {
  const DynamicLibrary crashHandler = InitQxch();
  const SingleInstance instance = CheckSingleInstance();
  if (!instance.isSingle) {
    LOG_TRACE(kScope, L"Not a single instance");
    return;
  }
  stutil::RestoreProductLogging();  // a run that was killed may have left it raised
  RunMode(commandLine);
}

}  // namespace

int WINAPI wWinMain(HINSTANCE, HINSTANCE, PWSTR commandLine, int) {
  RestrictLibrarySearch();
  try {
    const std::shared_ptr<logging::CLogDLL> logger = logging::CLogDLL::Get();
    // Before the first line: it would go where the library writes without a configuration.
    logging::LoggerConfig::Init();
    const logging::ScopeTrace trace(kScope);
    try {
      Run(commandLine);
    } catch (const std::exception& exception) {
      LOG_ERROR(kScope, L"unexpected failure: %S", exception.what());
    }
  } catch (...) {  // no memory even for the log; there is nobody left to tell
  }
  return EndingCode(0);
}
