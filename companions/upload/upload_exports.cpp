// The exported functions: each checks its arguments, does its job on the context and lets nothing escape.
#include <cstring>
#include <memory>
#include <new>
#include <utility>

#include "companions/upload/http_text.h"
#include "companions/upload/upload_context.h"
#include "companions/upload/upload_request.h"
#include "companions/upload/upload_response.h"
#include "companions/upload/upload_results.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/program_path.h"

namespace {

using qxlink::UploadAnswer;
using qxlink::UploadRequest;

// Runs `job`, which returns a QxskylaneResult.
template <class Job>
int32_t Guarded(Job job) noexcept {
  try {
    return job();
  } catch (const std::bad_alloc&) {
    return QXSKYLANE_OUT_OF_MEMORY;
  } catch (...) {
    return QXSKYLANE_INTERNAL_ERROR;
  }
}

template <class Job>
int32_t WithRequest(const QxskylaneContext* context, const QxskylaneUpload* upload, Job job) noexcept {
  return Guarded([&]() -> int32_t {
    if (context == nullptr) return QXSKYLANE_BAD_ARGUMENT;
    UploadRequest request;
    const int32_t result = qxlink::ReadUploadRequest(upload, request);
    if (result == QXSKYLANE_OK) return job(request);
    LOG_ERROR(L"qxlink::Upload", L"the upload request has no path or no category, or its tags are no JSON object");
    return result;
  });
}

constexpr char kText[] = "text/plain; charset=utf-8";
constexpr char kJson[] = "application/json";
constexpr char kBytes[] = "application/octet-stream";
constexpr uint64_t kLargestMessage = 64 << 20;

bool IsJson(std::string_view text) {
  Json::Value document;
  std::string problem;
  return ParseJson(text, document, problem);
}

// A message as the service gets it. False when it cannot be one.
struct Message {
  std::string topic;
  const char* contentType = kText;
  std::string_view bytes;

  bool Read(const char* newTopic, const char* type, const void* data, uint64_t size) {
    if (newTopic == nullptr || (data == nullptr && size != 0) || size > kLargestMessage) return false;
    topic = newTopic;
    contentType = type;
    bytes = {static_cast<const char*>(data), static_cast<size_t>(size)};
    return !topic.empty() && qxlink::IsHeaderValue(topic) && (type != kJson || IsJson(bytes));
  }
  bool Read(const char* newTopic, const char* type, const char* text) {
    return text != nullptr && Read(newTopic, type, text, std::strlen(text));
  }
};

template <class... Parts>
int32_t Push(QxskylaneContext* context, Parts... parts) noexcept {
  return Guarded([&]() -> int32_t {
    Message message;
    if (context == nullptr || !message.Read(parts...)) return QXSKYLANE_BAD_ARGUMENT;
    UploadAnswer answer;
    return context->Tell(message.topic, message.contentType, message.bytes, answer);
  });
}

template <class... Parts>
int32_t Ask(QxskylaneContext* context, QxskylaneResponse** response, Parts... parts) noexcept {
  if (response == nullptr) return QXSKYLANE_BAD_ARGUMENT;
  *response = nullptr;
  return Guarded([&]() -> int32_t {
    Message message;
    if (context == nullptr || !message.Read(parts...)) return QXSKYLANE_BAD_ARGUMENT;
    UploadAnswer answer;
    const int32_t result = context->Tell(message.topic, message.contentType, message.bytes, answer);
    // qxskylane_free_response takes it back.
    if (result == QXSKYLANE_OK) *response = std::make_unique<qxlink::UploadResponse>(std::move(answer)).release();
    return result;
  });
}

// `copies`: the bytes of the message are the caller's only until the return.
template <class... Parts>
int32_t AskLater(QxskylaneContext* context, QxskylaneDone done, void* user, bool copies, Parts... parts) noexcept {
  return Guarded([&]() -> int32_t {
    Message message;
    if (context == nullptr || done == nullptr || !message.Read(parts...)) return QXSKYLANE_BAD_ARGUMENT;
    std::string copy(copies ? message.bytes : std::string_view());
    context->Begin(
        [context, message, copies, copy = std::move(copy)](UploadAnswer& answer) {
          return context->Tell(message.topic, message.contentType, copies ? copy : message.bytes, answer);
        },
        done, user);
    return QXSKYLANE_OK;
  });
}

// From now on the library stays loaded until the process ends, however often it is let go: a run-time library that is
// linked into a library, as GCC's is, leaves handles and memory behind with every unloading.
void StayLoaded() {
  HMODULE self = nullptr;
  if (GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_PIN | GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS,
                         reinterpret_cast<const wchar_t*>(&StayLoaded), &self)) {
    return;
  }
  LOG_WARNING(L"qxlink::StayLoaded", L"the library cannot stay loaded, error %u", GetLastError());
}

}  // namespace

int32_t qxskylane_init(QxskylaneContext** context) {
  if (context == nullptr) return QXSKYLANE_BAD_ARGUMENT;
  *context = nullptr;
  return Guarded([&] {
    auto made = std::make_unique<QxskylaneContext>();
    StayLoaded();
    const int32_t result = made->Configure(OwnModuleFolder());
    if (result == QXSKYLANE_OK) *context = made.release();  // qxskylane_uninit takes it back
    return result;
  });
}

int32_t qxskylane_uninit(QxskylaneContext* context) {
  if (context == nullptr) return QXSKYLANE_BAD_ARGUMENT;
  const std::unique_ptr<QxskylaneContext> owner(context);
  return QXSKYLANE_OK;
}

int32_t qxskylane_push_info(QxskylaneContext* context, const char* topic, const char* text) {
  return Push(context, topic, kText, text);
}

int32_t qxskylane_push_json(QxskylaneContext* context, const char* topic, const char* json) {
  return Push(context, topic, kJson, json);
}

int32_t qxskylane_push_bin(QxskylaneContext* context, const char* topic, const void* bytes, uint64_t size) {
  return Push(context, topic, kBytes, bytes, size);
}

int32_t qxskylane_ask(QxskylaneContext* context, const char* topic, const char* text, QxskylaneResponse** response) {
  return Ask(context, response, topic, kText, text);
}

int32_t qxskylane_ask_json(QxskylaneContext* context, const char* topic, const char* json,
                           QxskylaneResponse** response) {
  return Ask(context, response, topic, kJson, json);
}

int32_t qxskylane_ask_bin(QxskylaneContext* context, const char* topic, const void* bytes, uint64_t size,
                          QxskylaneResponse** response) {
  return Ask(context, response, topic, kBytes, bytes, size);
}

int32_t qxskylane_ask_async(QxskylaneContext* context, const char* topic, const char* text, QxskylaneDone done,
                            void* user) {
  return AskLater(context, done, user, true, topic, kText, text);
}

int32_t qxskylane_ask_json_async(QxskylaneContext* context, const char* topic, const char* json, QxskylaneDone done,
                                 void* user) {
  return AskLater(context, done, user, true, topic, kJson, json);
}

int32_t qxskylane_ask_bin_async(QxskylaneContext* context, const char* topic, const void* bytes, uint64_t size,
                                QxskylaneDone done, void* user) {
  return AskLater(context, done, user, false, topic, kBytes, bytes, size);
}

void qxskylane_free_response(QxskylaneResponse* response) {
  const std::unique_ptr<qxlink::UploadResponse> owner(static_cast<qxlink::UploadResponse*>(response));
}

const char* qxskylane_text(int32_t result) {
  return qxlink::TextOfResult(result);
}

int32_t qxskylane_set_option(QxskylaneContext* context, int32_t option, int64_t value) {
  if (context == nullptr) return QXSKYLANE_BAD_ARGUMENT;
  return Guarded([&] { return context->SetOption(option, value); });
}

int32_t qxskylane_set_optionv(QxskylaneContext* context, int32_t option, const void* value, size_t size) {
  if (context == nullptr || value == nullptr) return QXSKYLANE_BAD_ARGUMENT;
  return Guarded([&] { return context->SetOption(option, std::string_view(static_cast<const char*>(value), size)); });
}

int32_t qxskylane_get_option(QxskylaneContext* context, int32_t option, int64_t* value) {
  if (context == nullptr || value == nullptr) return QXSKYLANE_BAD_ARGUMENT;
  return Guarded([&] { return context->GetOption(option, *value); });
}

int32_t qxskylane_file_upload(QxskylaneContext* context, const QxskylaneUpload* upload) {
  return WithRequest(context, upload, [&](const UploadRequest& request) {
    UploadAnswer answer;
    return context->UploadFile(request, answer);
  });
}

int32_t qxskylane_file_upload_async(QxskylaneContext* context, const QxskylaneUpload* upload, QxskylaneDone done,
                                    void* user) {
  if (done == nullptr) return QXSKYLANE_BAD_ARGUMENT;
  return WithRequest(context, upload, [&](const UploadRequest& request) -> int32_t {
    context->Begin([context, request](UploadAnswer& answer) { return context->UploadFile(request, answer); }, done,
                   user);
    return QXSKYLANE_OK;
  });
}

int32_t qxskylane_mem_upload(QxskylaneContext* context, const QxskylaneUpload* upload, const void* bytes,
                             uint64_t size) {
  if (bytes == nullptr && size != 0) return QXSKYLANE_BAD_ARGUMENT;
  const std::string_view view(static_cast<const char*>(bytes), static_cast<size_t>(size));
  return WithRequest(context, upload, [&](const UploadRequest& request) {
    UploadAnswer answer;
    return context->UploadMemory(request, view, answer);
  });
}

int32_t qxskylane_mem_upload_async(QxskylaneContext* context, const QxskylaneUpload* upload, const void* bytes,
                                   uint64_t size, QxskylaneDone done, void* user) {
  if (done == nullptr || (bytes == nullptr && size != 0)) return QXSKYLANE_BAD_ARGUMENT;
  const std::string_view view(static_cast<const char*>(bytes), static_cast<size_t>(size));
  return WithRequest(context, upload, [&](const UploadRequest& request) -> int32_t {
    context->Begin(
        [context, request, view](UploadAnswer& answer) { return context->UploadMemory(request, view, answer); }, done,
        user);
    return QXSKYLANE_OK;
  });
}
