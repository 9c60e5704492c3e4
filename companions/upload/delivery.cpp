#include "companions/upload/delivery.h"

#include <utility>

#include "companions/upload/outbox.h"
#include "core/files.h"
#include "core/logging.h"
#include "core/text.h"

namespace qxlink {
namespace {

constexpr wchar_t kScope[] = L"qxlink::Upload";
constexpr uint64_t kLargestCaFile = 4 << 20;

// Whether sending the same file another day may come to something.
bool IsWorthKeeping(int32_t result) {
  return result >= QXSKYLANE_NO_CONNECTION || result == QXSKYLANE_CONFIGURATION_INVALID ||
         result == QXSKYLANE_INTERNAL_ERROR || result == QXSKYLANE_OUT_OF_MEMORY;
}

int32_t ResultOf(HttpOutcome outcome) {
  switch (outcome) {
    case HttpOutcome::Done:
      return QXSKYLANE_OK;
    case HttpOutcome::NoSecureChannel:
    case HttpOutcome::BadCertificate:
      return QXSKYLANE_NO_SECURE_CHANNEL;
    case HttpOutcome::TimedOut:
      return QXSKYLANE_TIMED_OUT;
    case HttpOutcome::Cancelled:
      return QXSKYLANE_CANCELLED;
    default:
      return QXSKYLANE_NO_CONNECTION;
  }
}

// The bytes of a message.
class BytesBody : public HttpBody {
 public:
  explicit BytesBody(std::string_view bytes) : m_bytes(bytes) {}
  uint32_t Size() const override { return static_cast<uint32_t>(m_bytes.size()); }
  bool Read(uint32_t offset, std::span<char> buffer) override {
    return m_bytes.substr(offset).copy(buffer.data(), buffer.size()) == buffer.size();
  }
  bool Sent(uint32_t /*count*/) override { return true; }

 private:
  const std::string_view m_bytes;
};

}  // namespace

Delivery::Delivery(const UploadConfig& config, std::wstring libraryFolder, const CancelSignal& cancel)
    : m_config(config), m_libraryFolder(std::move(libraryFolder)), m_cancel(cancel) {}

int32_t Delivery::Upload(const UploadRequest& request, UploadSource& source, const DeliveryOptions& options,
                         UploadAnswer& answer) {
  if (m_config.endpoint.empty()) {
    std::wstring path;
    const int32_t result = Put(options.outbox, request, source, path);
    if (result == QXSKYLANE_OK) answer.location = ToUtf8(path);
    return result;
  }
  if (m_config.keepInOutboxOnFailure) SendWaiting(request, options);
  std::string sha256;
  const int32_t result = Send(request, source, options.usePlainHttp, answer, sha256);
  if (result == QXSKYLANE_OK) {
    Forget(sha256);
  } else if (m_config.keepInOutboxOnFailure && IsWorthKeeping(result)) {
    Keep(request, source, options, sha256);
  }
  return result;
}

// Finds out where to talk to, and by whose word the server is trusted.
int32_t Delivery::Reach(const std::string& address, bool usePlainHttp, Service& service) const {
  auto parsed = ParseHttpAddress(address);
  if (!parsed) return QXSKYLANE_CONFIGURATION_INVALID;
  service.address = *std::move(parsed);
  if (usePlainHttp && std::exchange(service.address.isSecure, false) && service.address.port == 443) {
    service.address.port = 80;
  }
  service.checksTrust = !m_config.caFile.empty() && service.address.isSecure;
  if (!service.checksTrust) return QXSKYLANE_OK;
  const std::wstring path = ResolveOutboxFolder(ToWide(m_config.caFile), m_libraryFolder);
  std::string bytes;
  DWORD error = path.empty() ? ERROR_ENVVAR_NOT_FOUND : ReadWholeFile(path, kLargestCaFile, bytes);
  if (error == ERROR_SUCCESS) error = service.trust.Load(bytes);
  if (error == ERROR_SUCCESS) return QXSKYLANE_OK;
  LOG_ERROR(kScope, L"\"ca_file\" of qxlink.json cannot be read as certificates, error %u; nothing was sent", error);
  return QXSKYLANE_CONFIGURATION_INVALID;
}

int32_t Delivery::Send(const UploadRequest& request, UploadSource& source, bool usePlainHttp, UploadAnswer& answer,
                       std::string& sha256) const {
  Service service;
  if (const int32_t result = Reach(m_config.endpoint, usePlainHttp, service); result != QXSKYLANE_OK) return result;
  HttpClient client(service.address, m_config, service.checksTrust ? &service.trust : nullptr, m_cancel);
  if (const DWORD error = client.Open(); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"the system's HTTP client cannot be used, error %u", error);
    return QXSKYLANE_INTERNAL_ERROR;
  }
  TusUpload upload(client, m_config, request, source, m_cancel);
  const int32_t result = upload.Run(answer);
  sha256 = upload.Sha256();
  return result;
}

int32_t Delivery::Tell(std::string_view topic, const char* contentType, std::string_view bytes, bool usePlainHttp,
                       UploadAnswer& answer) {
  if (m_config.messages.empty()) return QXSKYLANE_NOT_SUPPORTED;
  Service service;
  if (const int32_t result = Reach(m_config.messages, usePlainHttp, service); result != QXSKYLANE_OK) return result;
  HttpClient client(service.address, m_config, service.checksTrust ? &service.trust : nullptr, m_cancel);
  if (const DWORD error = client.Open(); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"the system's HTTP client cannot be used, error %u", error);
    return QXSKYLANE_INTERNAL_ERROR;
  }
  BytesBody body(bytes);
  HttpRequest request{
      L"POST", service.address.target, {{"Content-Type", contentType}, {"X-Topic", std::string(topic)}}};
  request.body = &body;
  HttpReply reply;
  if (const int32_t result = ResultOf(client.Exchange(request, reply)); result != QXSKYLANE_OK) return result;
  answer.status = reply.status;
  answer.body = std::move(reply.body);
  if (reply.status >= 200 && reply.status <= 299) return QXSKYLANE_OK;
  LOG_WARNING(L"qxlink::Tell", L"the service answered a message with %u", reply.status);
  return reply.status >= 400 && reply.status <= 499 ? QXSKYLANE_SERVICE_REFUSED : QXSKYLANE_SERVICE_FAILED;
}

int32_t Delivery::OpenOutbox(const std::string& configured, std::wstring& folder) const {
  folder = ResolveOutboxFolder(ToWide(configured), m_libraryFolder);
  if (folder.empty()) {
    LOG_ERROR(kScope, L"the outbox folder names an environment variable that does not exist");
    return QXSKYLANE_CONFIGURATION_INVALID;
  }
  if (const DWORD error = CreateOutboxFolder(folder); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"the outbox folder cannot be made, error %u", error);
    return QXSKYLANE_OUTBOX_UNWRITABLE;
  }
  DeleteAbandonedParts(folder);
  return QXSKYLANE_OK;
}

int32_t Delivery::Put(const std::string& outbox, const UploadRequest& request, UploadSource& source,
                      std::wstring& path) const {
  std::wstring folder;
  const int32_t result = OpenOutbox(outbox, folder);
  return result == QXSKYLANE_OK ? PutIntoOutbox(folder, request, source, path) : result;
}

// Once: what this object itself keeps is for the next one. When the service cannot be reached for one file, the others
// are not tried either.
void Delivery::SendWaiting(const UploadRequest& request, const DeliveryOptions& options) {
  {
    const std::lock_guard lock(m_mutex);
    if (std::exchange(m_hasSentWaiting, true)) return;
  }
  std::wstring folder;
  if (OpenOutbox(options.outbox, folder) != QXSKYLANE_OK) return;
  for (const std::wstring& path : FilesInOutbox(folder)) {
    FileSource source;
    if (source.OpenForMe(path) != ERROR_SUCCESS) continue;  // another instance sends it
    UploadRequest waiting = RequestOfOutboxFile(path);
    if (waiting.category.empty()) waiting.category = request.category;
    LOG_INFO(kScope, L"sending what waits in the outbox, %llu bytes", source.Size());
    UploadAnswer answer;
    std::string sha256;
    const int32_t result = Send(waiting, source, options.usePlainHttp, answer, sha256);
    if (result == QXSKYLANE_OK) {
      RemoveFromOutbox(path, source);
    } else if (result != QXSKYLANE_SERVICE_REFUSED) {
      return;
    }
  }
}

// A caller may try the same file again, by plain HTTP for one: it is kept once.
void Delivery::Keep(const UploadRequest& request, UploadSource& source, const DeliveryOptions& options,
                    const std::string& sha256) {
  {
    const std::lock_guard lock(m_mutex);
    if (m_kept.count(sha256) != 0) return;
  }
  UploadRequest quiet = request;
  quiet.progress = nullptr;
  std::wstring path;
  if (Put(options.outbox, quiet, source, path) != QXSKYLANE_OK) return;
  LOG_WARNING(kScope, L"the file was NOT sent; it waits in the outbox for the next run");
  const std::lock_guard lock(m_mutex);
  m_kept.emplace(sha256, path);
}

void Delivery::Forget(const std::string& sha256) {
  std::wstring path;
  {
    const std::lock_guard lock(m_mutex);
    const auto found = m_kept.find(sha256);
    if (found == m_kept.end()) return;
    path = found->second;
    m_kept.erase(found);
  }
  FileSource source;
  if (source.OpenForMe(path) == ERROR_SUCCESS) RemoveFromOutbox(path, source);
}

}  // namespace qxlink
