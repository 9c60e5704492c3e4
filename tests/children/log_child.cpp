// Logs as the program does, and says on its standard output what happened:
//   log_child lines COUNT     COUNT lines, the number of each printed after it is written
//   log_child threads COUNT   COUNT lines from each of four threads
//   log_child scopes          nested scopes, one left by an exception, and one with a long name
//   log_child facade          what the facade and the configuration say
#include <cstdio>
#include <cstdlib>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include "core/logger_config.h"
#include "core/logging.h"
#include "core/scope_trace.h"

namespace {

void WriteLines(int count, bool report) {
  for (int i = 0; i < count; ++i) {
    LOG_INFO(L"child", L"line %d of %u/%u, padded so that a line that is torn shows: <%S>", i,
             static_cast<unsigned>(GetCurrentProcessId()), static_cast<unsigned>(GetCurrentThreadId()),
             "0123456789abcdefghijklmnopqrstuvwxyz");
    if (!report) continue;
    std::printf("%d\n", i);
    std::fflush(stdout);
  }
}

void WriteFromThreads(int count) {
  std::vector<std::thread> threads;
  threads.reserve(4);
  for (int i = 0; i < 4; ++i)
    threads.emplace_back(WriteLines, count, false);
  for (std::thread& thread : threads)
    thread.join();
}

void Inner() {
  const logging::ScopeTrace trace(L"Inner");
  LOG_WARNING(L"Inner", L"before the exception");
  throw std::runtime_error("leave");
}

void WriteScopes() {
  const logging::ScopeTrace trace(L"Outer");
  try {
    Inner();
  } catch (const std::runtime_error&) {
    LOG_ERROR(L"Outer", L"after the exception");
  }
  const logging::ScopeTrace longName(std::wstring(300, L'x').c_str());
}

void DescribeFacade(const logging::CLogDLL& library) {
  int evaluated = 0;
  const bool configured = logging::LoggerConfig::Init();
  LOG_ERROR(L"child", L"an error, evaluation %d", ++evaluated);
  std::printf("bound %d, configured %d, enabled %d, evaluated %d\n", library.IsBound() ? 1 : 0, configured ? 1 : 0,
              logging::IsEnabled() ? 1 : 0, evaluated);
}

}  // namespace

int main(int argc, char** argv) {
  const std::string command = argc > 1 ? argv[1] : "";
  const int count = argc > 2 ? std::atoi(argv[2]) : 0;
  const auto library = logging::CLogDLL::Get();
  if (command == "facade") {
    DescribeFacade(*library);
    return 0;
  }
  if (!logging::LoggerConfig::Init()) return 2;
  if (command == "lines") {
    WriteLines(count, true);
  } else if (command == "threads") {
    WriteFromThreads(count);
  } else if (command == "scopes") {
    WriteScopes();
  } else {
    return 1;
  }
  return 0;
}
