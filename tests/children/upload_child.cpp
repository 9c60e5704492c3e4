// Uploads a file through the qxlink.dll beside it, and says on its standard output what came of it.
// usage: upload_child FILE [OPTION …]
//   memory       as bytes in memory, under the file's name
//   async        by the asynchronous form
//   plain        sets option 20 first, and says what that gave
//   fallback     as the program does: once more by plain HTTP when there is no secure channel
//   cancel=N     the progress function cancels when N bytes are sent
//   end=N        ends the context N milliseconds after an asynchronous call
//   ask          asks the service {"q":1} under the topic "status" instead, and says the answer
//   idle         does everything but the upload: for comparing memory
// prints: "option=R", "answer=S BODY", "begun=R", "done=R status=S location=L", "result=R sent=BYTES total=BYTES",
// "seconds=… peak_memory=…"; the time is that from the first byte to the answer to the last.
#include <windows.h>

#include <psapi.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <string>
#include <vector>

#include "core/dynamic_library.h"
#include "core/files.h"
#include "core/logger_config.h"
#include "core/logging.h"
#include "core/text.h"
#include "interfaces/qxlink_api.h"

namespace {

using Clock = std::chrono::steady_clock;

struct Options {
  bool memory = false;
  bool async = false;
  bool plain = false;
  bool fallback = false;
  bool ask = false;
  bool idle = false;
  uint64_t cancelAt = ~uint64_t{0};
  int endAfter = -1;
};

struct Seen {
  uint64_t cancelAt = 0;
  uint64_t sent = 0;
  uint64_t total = 0;
  Clock::time_point begin = Clock::now();
  Clock::time_point end = begin;
  KernelHandle done{CreateEventW(nullptr, TRUE, FALSE, nullptr)};
  int32_t result = -1;
};

int32_t OnProgress(void* user, uint64_t sent, uint64_t total) {
  Seen& seen = *static_cast<Seen*>(user);
  if (sent == 0) seen.begin = Clock::now();
  seen.sent = sent;
  seen.total = total;
  seen.end = Clock::now();
  return sent >= seen.cancelAt ? 1 : 0;
}

void OnDone(void* user, int32_t result, const QxskylaneResponse* response) {
  Seen& seen = *static_cast<Seen*>(user);
  seen.result = result;
  std::printf("done=%d status=%u location=%s\n", result, response == nullptr ? 0 : response->http_status,
              response == nullptr || response->location == nullptr ? "-" : response->location);
  SetEvent(seen.done.Get());
}

Options Read(int count, wchar_t** arguments) {
  Options options;
  for (int i = 2; i < count; ++i) {
    const std::string option = ToUtf8(arguments[i]);
    options.memory |= option == "memory";
    options.async |= option == "async";
    options.plain |= option == "plain";
    options.fallback |= option == "fallback";
    options.ask |= option == "ask";
    options.idle |= option == "idle";
    if (option.starts_with("cancel=")) options.cancelAt = std::stoull(option.substr(7));
    if (option.starts_with("end=")) options.endAfter = std::stoi(option.substr(4));
  }
  return options;
}

class Uploader {
 public:
  Uploader(const DynamicLibrary& library, QxskylaneContext* context, const std::string& path, const Options& options)
      : m_library(library), m_context(context), m_path(path), m_options(options) {
    m_seen.cancelAt = options.cancelAt;
    if (options.memory) ReadWholeFile(ToWide(path), uint64_t{1} << 30, m_bytes);
    m_upload.size = sizeof m_upload;
    m_upload.file_path = m_path.c_str();
    m_upload.category = "kvsetuplogs";
    m_upload.tags_json = R"({"tags":["Quorvex Guard Basic","support_tool"]})";
    m_upload.progress = OnProgress;
    m_upload.user = &m_seen;
  }

  int32_t Upload() {
    if (!m_options.async) {
      return m_options.memory ? Get<decltype(&qxskylane_mem_upload)>("qxskylane_mem_upload")(
                                    m_context, &m_upload, m_bytes.data(), m_bytes.size())
                              : Get<decltype(&qxskylane_file_upload)>("qxskylane_file_upload")(m_context, &m_upload);
    }
    const int32_t begun = m_options.memory ? Get<decltype(&qxskylane_mem_upload_async)>("qxskylane_mem_upload_async")(
                                                 m_context, &m_upload, m_bytes.data(), m_bytes.size(), OnDone, &m_seen)
                                           : Get<decltype(&qxskylane_file_upload_async)>("qxskylane_file_upload_async")(
                                                 m_context, &m_upload, OnDone, &m_seen);
    std::printf("begun=%d\n", begun);
    std::fflush(stdout);
    if (begun != QXSKYLANE_OK) return begun;
    WaitForSingleObject(m_seen.done.Get(), m_options.endAfter < 0 ? INFINITE : static_cast<DWORD>(m_options.endAfter));
    return m_seen.result;
  }

  int32_t Ask() const {
    QxskylaneResponse* response = nullptr;
    const int32_t result =
        Get<decltype(&qxskylane_ask_json)>("qxskylane_ask_json")(m_context, "status", R"({"q":1})", &response);
    if (response != nullptr) {
      std::printf("answer=%u %s\n", response->http_status, static_cast<const char*>(response->body));
    }
    Get<decltype(&qxskylane_free_response)>("qxskylane_free_response")(response);
    return result;
  }

  template <class Function>
  Function Get(const char* name) const {
    return m_library.Resolve<Function>(name);
  }

  const Seen& What() const { return m_seen; }

 private:
  const DynamicLibrary& m_library;
  QxskylaneContext* m_context;
  const std::string m_path;
  const Options m_options;
  std::string m_bytes;
  QxskylaneUpload m_upload{};
  Seen m_seen;
};

void PrintFigures(const Seen& seen) {
  PROCESS_MEMORY_COUNTERS counters{};
  K32GetProcessMemoryInfo(GetCurrentProcess(), &counters, sizeof counters);
  std::printf("seconds=%.4f peak_memory=%llu\n", std::chrono::duration<double>(seen.end - seen.begin).count(),
              static_cast<unsigned long long>(counters.PeakWorkingSetSize));
}

}  // namespace

int wmain(int count, wchar_t** arguments) {
  if (count < 2) return 2;
  const Options options = Read(count, arguments);
  const auto log = logging::CLogDLL::Get();
  logging::LoggerConfig::Init();
  const DynamicLibrary library(L"qxlink.dll");
  if (!library) return 3;
  QxskylaneContext* context = nullptr;
  int32_t result = library.Resolve<decltype(&qxskylane_init)>("qxskylane_init")(&context);
  if (result != QXSKYLANE_OK) {
    std::printf("result=%d sent=0 total=0\n", result);
    return 0;
  }
  const auto setOption = library.Resolve<decltype(&qxskylane_set_option)>("qxskylane_set_option");
  Uploader uploader(library, context, ToUtf8(arguments[1]), options);
  if (options.plain) std::printf("option=%d\n", setOption(context, QXSKYLANE_OPTION_PLAIN_HTTP, 1));
  if (!options.idle) result = options.ask ? uploader.Ask() : uploader.Upload();
  if (options.fallback && result == QXSKYLANE_NO_SECURE_CHANNEL) {
    std::printf("option=%d\n", setOption(context, QXSKYLANE_OPTION_PLAIN_HTTP, 1));
    result = uploader.Upload();
  }
  library.Resolve<decltype(&qxskylane_uninit)>("qxskylane_uninit")(context);
  if (options.endAfter >= 0) result = uploader.What().result;
  std::printf("result=%d sent=%llu total=%llu\n", result, static_cast<unsigned long long>(uploader.What().sent),
              static_cast<unsigned long long>(uploader.What().total));
  PrintFigures(uploader.What());
  return 0;
}
