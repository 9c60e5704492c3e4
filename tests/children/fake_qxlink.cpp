// A cloud communication library that does what a test tells it and writes down what it was asked: all 20 exports, no
// upload. Environment variables of the process, read at each call:
//   FAKE_QXLINK_INIT       the result of qxskylane_init; default 0
//   FAKE_QXLINK_UPLOADS    the results of qxskylane_file_upload, one after the other, separated by commas; the last one
//                          holds for all that follow; default 0
//   FAKE_QXLINK_OPTION     the result of qxskylane_set_option; default 0
//   FAKE_QXLINK_RECORD     a file to which each call is appended, one line each
#include <windows.h>

#include <cstdlib>
#include <string>

#include "interfaces/qxlink_api.h"

struct QxskylaneContext {
  int uploads = 0;
};

namespace {

QxskylaneContext g_context;

std::wstring Variable(const wchar_t* name) {
  std::wstring value(1000, L'\0');
  value.resize(GetEnvironmentVariableW(name, value.data(), static_cast<DWORD>(value.size())));
  return value;
}

int32_t Number(const wchar_t* name) {
  return static_cast<int32_t>(wcstol(Variable(name).c_str(), nullptr, 10));
}

// The result of upload number `index`.
int32_t UploadResult(int index) {
  std::wstring results = Variable(L"FAKE_QXLINK_UPLOADS");
  for (; index > 0; --index) {
    const size_t comma = results.find(L',');
    if (comma == std::wstring::npos) break;
    results.erase(0, comma + 1);
  }
  return static_cast<int32_t>(wcstol(results.c_str(), nullptr, 10));
}

void Record(const std::string& line) {
  const std::wstring path = Variable(L"FAKE_QXLINK_RECORD");
  if (path.empty()) return;
  const HANDLE file = CreateFileW(path.c_str(), FILE_APPEND_DATA, FILE_SHARE_READ, nullptr, OPEN_ALWAYS,
                                  FILE_ATTRIBUTE_NORMAL, nullptr);
  const std::string text = line + "\n";
  DWORD written = 0;
  WriteFile(file, text.data(), static_cast<DWORD>(text.size()), &written, nullptr);
  CloseHandle(file);
}

int32_t NotExpected(const char* name) {
  Record(std::string("not expected: ") + name);
  return QXSKYLANE_NOT_SUPPORTED;
}

}  // namespace

int32_t qxskylane_init(QxskylaneContext** context) {
  Record("init");
  const int32_t result = Number(L"FAKE_QXLINK_INIT");
  g_context = QxskylaneContext();
  *context = result == 0 ? &g_context : nullptr;
  return result;
}

int32_t qxskylane_uninit(QxskylaneContext* context) {
  Record(context == &g_context ? "uninit" : "uninit of another context");
  return 0;
}

int32_t qxskylane_set_option(QxskylaneContext*, int32_t option, int64_t value) {
  Record("set_option " + std::to_string(option) + " " + std::to_string(value));
  return Number(L"FAKE_QXLINK_OPTION");
}

int32_t qxskylane_file_upload(QxskylaneContext* context, const QxskylaneUpload* upload) {
  const bool isWhole = context == &g_context && upload->size == sizeof(QxskylaneUpload);
  Record(std::string(isWhole ? "upload " : "damaged upload ") + upload->file_path + " " + upload->category + " " +
         upload->tags_json);
  return UploadResult(g_context.uploads++);
}

int32_t qxskylane_push_info(QxskylaneContext*, const char*, const char*) {
  return NotExpected("push_info");
}
int32_t qxskylane_push_json(QxskylaneContext*, const char*, const char*) {
  return NotExpected("push_json");
}
int32_t qxskylane_push_bin(QxskylaneContext*, const char*, const void*, uint64_t) {
  return NotExpected("push_bin");
}
int32_t qxskylane_ask(QxskylaneContext*, const char*, const char*, QxskylaneResponse**) {
  return NotExpected("ask");
}
int32_t qxskylane_ask_json(QxskylaneContext*, const char*, const char*, QxskylaneResponse**) {
  return NotExpected("ask_json");
}
int32_t qxskylane_ask_bin(QxskylaneContext*, const char*, const void*, uint64_t, QxskylaneResponse**) {
  return NotExpected("ask_bin");
}
int32_t qxskylane_ask_async(QxskylaneContext*, const char*, const char*, QxskylaneDone, void*) {
  return NotExpected("ask_async");
}
int32_t qxskylane_ask_json_async(QxskylaneContext*, const char*, const char*, QxskylaneDone, void*) {
  return NotExpected("ask_json_async");
}
int32_t qxskylane_ask_bin_async(QxskylaneContext*, const char*, const void*, uint64_t, QxskylaneDone, void*) {
  return NotExpected("ask_bin_async");
}
void qxskylane_free_response(QxskylaneResponse*) {
  NotExpected("free_response");
}
const char* qxskylane_text(int32_t) {
  return "fake";
}
int32_t qxskylane_set_optionv(QxskylaneContext*, int32_t, const void*, size_t) {
  return NotExpected("set_optionv");
}
int32_t qxskylane_get_option(QxskylaneContext*, int32_t, int64_t*) {
  return NotExpected("get_option");
}
int32_t qxskylane_file_upload_async(QxskylaneContext*, const QxskylaneUpload*, QxskylaneDone, void*) {
  return NotExpected("file_upload_async");
}
int32_t qxskylane_mem_upload(QxskylaneContext*, const QxskylaneUpload*, const void*, uint64_t) {
  return NotExpected("mem_upload");
}
int32_t qxskylane_mem_upload_async(QxskylaneContext*, const QxskylaneUpload*, const void*, uint64_t, QxskylaneDone,
                                   void*) {
  return NotExpected("mem_upload_async");
}
