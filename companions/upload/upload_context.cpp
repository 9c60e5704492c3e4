#include "companions/upload/upload_context.h"

#include <new>
#include <utility>

#include "companions/upload/upload_response.h"
#include "core/files.h"
#include "core/text.h"

namespace qxlink {
namespace {

constexpr wchar_t kConfigureScope[] = L"qxlink::Configure";
constexpr wchar_t kUploadScope[] = L"qxlink::Upload";
constexpr uint64_t kLongestConfiguration = 64 << 10;

}  // namespace
}  // namespace qxlink

using namespace qxlink;

QxskylaneContext::~QxskylaneContext() {
  m_cancel.Set();
}

int32_t QxskylaneContext::Configure(const std::wstring& libraryFolder) {
  if (libraryFolder.empty()) {  // a configuration elsewhere would send packages elsewhere
    LOG_ERROR(kConfigureScope, L"the library does not know its folder, where qxlink.json lies");
    return QXSKYLANE_CONFIGURATION_INVALID;
  }
  std::string json;
  const DWORD error = ReadWholeFile(libraryFolder + L"\\qxlink.json", kLongestConfiguration, json);
  if (error == ERROR_FILE_NOT_FOUND) {
    LOG_INFO(kConfigureScope, L"there is no qxlink.json, files go into the default outbox");
    json = "{}";
  } else if (error != ERROR_SUCCESS) {
    LOG_ERROR(kConfigureScope, L"qxlink.json cannot be read, error %u", error);
    return QXSKYLANE_CONFIGURATION_INVALID;
  }
  const ParsedUploadConfig parsed = ParseUploadConfig(json);
  for (const std::string& name : parsed.unknownMembers) {
    LOG_WARNING(kConfigureScope, L"qxlink.json: \"%s\" is not known", ToWide(name).c_str());
  }
  for (const std::string& problem : parsed.problems) {
    LOG_ERROR(kConfigureScope, L"qxlink.json: %s", ToWide(problem).c_str());
  }
  if (!parsed.problems.empty()) return QXSKYLANE_CONFIGURATION_INVALID;
  m_config = parsed.config;
  m_options.outbox = m_config.outbox;
  m_delivery = std::make_unique<Delivery>(m_config, libraryFolder, m_cancel);
  return QXSKYLANE_OK;
}

int32_t QxskylaneContext::SetOption(int32_t option, int64_t value) {
  if (option != QXSKYLANE_OPTION_PLAIN_HTTP) return QXSKYLANE_OPTION_UNKNOWN;
  if (value != 0 && value != 1) return QXSKYLANE_BAD_ARGUMENT;
  if (value == 1 && !m_config.allowPlainHttp) {
    LOG_WARNING(L"qxlink::SetOption", L"plain HTTP is not allowed by qxlink.json");
    return QXSKYLANE_OPTION_REFUSED;
  }
  const std::lock_guard lock(m_optionMutex);
  m_options.usePlainHttp = value == 1;
  return QXSKYLANE_OK;
}

int32_t QxskylaneContext::SetOption(int32_t option, std::string_view text) {
  if (option != QXSKYLANE_OPTION_OUTBOX) return QXSKYLANE_OPTION_UNKNOWN;
  if (text.empty() || text.find('\0') != std::string_view::npos) return QXSKYLANE_BAD_ARGUMENT;
  const std::lock_guard lock(m_optionMutex);
  m_options.outbox = text;
  return QXSKYLANE_OK;
}

int32_t QxskylaneContext::GetOption(int32_t option, int64_t& value) {
  if (option != QXSKYLANE_OPTION_PLAIN_HTTP) return QXSKYLANE_OPTION_UNKNOWN;
  const std::lock_guard lock(m_optionMutex);
  value = m_options.usePlainHttp ? 1 : 0;
  return QXSKYLANE_OK;
}

DeliveryOptions QxskylaneContext::Options() {
  const std::lock_guard lock(m_optionMutex);
  return m_options;
}

int32_t QxskylaneContext::UploadFile(const UploadRequest& request, UploadAnswer& answer) {
  FileSource source;
  if (const DWORD error = source.Open(ToWide(request.filePath)); error != ERROR_SUCCESS) {
    LOG_ERROR(kUploadScope, L"the file to upload cannot be opened, error %u", error);
    return QXSKYLANE_FILE_UNREADABLE;
  }
  return Upload(request, source, answer);
}

int32_t QxskylaneContext::UploadMemory(const UploadRequest& request, std::string_view bytes, UploadAnswer& answer) {
  MemorySource source(bytes);
  return Upload(request, source, answer);
}

int32_t QxskylaneContext::Upload(const UploadRequest& request, UploadSource& source, UploadAnswer& answer) {
  return m_delivery->Upload(request, source, Options(), answer);
}

int32_t QxskylaneContext::Tell(std::string_view topic, const char* contentType, std::string_view bytes,
                               UploadAnswer& answer) {
  return m_delivery->Tell(topic, contentType, bytes, Options().usePlainHttp, answer);
}

void QxskylaneContext::Begin(std::function<int32_t(UploadAnswer&)> job, QxskylaneDone done, void* user) {
  m_worker.Give([job = std::move(job), done, user, this]() noexcept {
    UploadAnswer answer;
    int32_t result = QXSKYLANE_CANCELLED;
    try {
      if (!m_cancel.IsSet()) result = job(answer);
    } catch (const std::bad_alloc&) {
      result = QXSKYLANE_OUT_OF_MEMORY;
    } catch (...) {
      result = QXSKYLANE_INTERNAL_ERROR;
    }
    const bool isAnswered = answer.status != 0 || !answer.location.empty();
    const UploadResponse response(std::move(answer));
    done(user, result, isAnswered ? &response : nullptr);
  });
}
