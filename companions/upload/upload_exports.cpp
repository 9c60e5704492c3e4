// The exported functions: each checks its arguments, does its job on the context and lets nothing escape.
#include <memory>
#include <new>

#include "companions/upload/upload_context.h"
#include "companions/upload/upload_request.h"
#include "companions/upload/upload_results.h"
#include "core/logging.h"
#include "core/program_path.h"

namespace {

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

// Messages and the asynchronous forms need a service; this version knows only the outbox.
int32_t NotSupported(const QxskylaneContext* context, const wchar_t* function) noexcept {
  return Guarded([&]() -> int32_t {
    if (context == nullptr) return QXSKYLANE_BAD_ARGUMENT;
    LOG_WARNING(function, L"not supported by this version");
    return QXSKYLANE_NOT_SUPPORTED;
  });
}

int32_t NotSupported(const QxskylaneContext* context, const wchar_t* function, QxskylaneResponse** response) noexcept {
  if (response == nullptr) return QXSKYLANE_BAD_ARGUMENT;
  *response = nullptr;
  return NotSupported(context, function);
}

int32_t NotSupported(const QxskylaneContext* context, const wchar_t* function, QxskylaneDone done) noexcept {
  return done == nullptr ? static_cast<int32_t>(QXSKYLANE_BAD_ARGUMENT) : NotSupported(context, function);
}

}  // namespace

int32_t qxskylane_init(QxskylaneContext** context) {
  if (context == nullptr) return QXSKYLANE_BAD_ARGUMENT;
  *context = nullptr;
  return Guarded([&] {
    auto made = std::make_unique<QxskylaneContext>();
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

int32_t qxskylane_push_info(QxskylaneContext* context, const char*, const char*) {
  return NotSupported(context, L"qxskylane_push_info");
}

int32_t qxskylane_push_json(QxskylaneContext* context, const char*, const char*) {
  return NotSupported(context, L"qxskylane_push_json");
}

int32_t qxskylane_push_bin(QxskylaneContext* context, const char*, const void*, uint64_t) {
  return NotSupported(context, L"qxskylane_push_bin");
}

int32_t qxskylane_ask(QxskylaneContext* context, const char*, const char*, QxskylaneResponse** response) {
  return NotSupported(context, L"qxskylane_ask", response);
}

int32_t qxskylane_ask_json(QxskylaneContext* context, const char*, const char*, QxskylaneResponse** response) {
  return NotSupported(context, L"qxskylane_ask_json", response);
}

int32_t qxskylane_ask_bin(QxskylaneContext* context, const char*, const void*, uint64_t, QxskylaneResponse** response) {
  return NotSupported(context, L"qxskylane_ask_bin", response);
}

int32_t qxskylane_ask_async(QxskylaneContext* context, const char*, const char*, QxskylaneDone done, void*) {
  return NotSupported(context, L"qxskylane_ask_async", done);
}

int32_t qxskylane_ask_json_async(QxskylaneContext* context, const char*, const char*, QxskylaneDone done, void*) {
  return NotSupported(context, L"qxskylane_ask_json_async", done);
}

int32_t qxskylane_ask_bin_async(QxskylaneContext* context, const char*, const void*, uint64_t, QxskylaneDone done,
                                void*) {
  return NotSupported(context, L"qxskylane_ask_bin_async", done);
}

// No function of this version makes a response.
void qxskylane_free_response(QxskylaneResponse*) {}

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
  return WithRequest(context, upload, [&](const UploadRequest& request) { return context->UploadFile(request); });
}

int32_t qxskylane_file_upload_async(QxskylaneContext* context, const QxskylaneUpload*, QxskylaneDone done, void*) {
  return NotSupported(context, L"qxskylane_file_upload_async", done);
}

int32_t qxskylane_mem_upload(QxskylaneContext* context, const QxskylaneUpload* upload, const void* bytes,
                             uint64_t size) {
  if (bytes == nullptr && size != 0) return QXSKYLANE_BAD_ARGUMENT;
  const std::string_view view(static_cast<const char*>(bytes), static_cast<size_t>(size));
  return WithRequest(context, upload,
                     [&](const UploadRequest& request) { return context->UploadMemory(request, view); });
}

int32_t qxskylane_mem_upload_async(QxskylaneContext* context, const QxskylaneUpload*, const void*, uint64_t,
                                   QxskylaneDone done, void*) {
  return NotSupported(context, L"qxskylane_mem_upload_async", done);
}
