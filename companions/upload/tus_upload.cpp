#include "companions/upload/tus_upload.h"

#include <algorithm>

#include "core/digest.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/text.h"

namespace qxlink {
namespace {

constexpr wchar_t kScope[] = L"qxlink::Upload";
constexpr size_t kHashBuffer = size_t{1} << 20;
constexpr unsigned kMostTlsFailures = 3;
constexpr size_t kLongestFileName = 200;

const wchar_t* MethodOf(TusRequest kind) {
  switch (kind) {
    case TusRequest::Capabilities:
      return L"OPTIONS";
    case TusRequest::Create:
      return L"POST";
    case TusRequest::Offset:
      return L"HEAD";
    default:
      return L"PATCH";
  }
}

uint64_t RandomNumber() {
  uint64_t number = 0;
  BCryptGenRandom(nullptr, reinterpret_cast<PUCHAR>(&number), sizeof number, BCRYPT_USE_SYSTEM_PREFERRED_RNG);
  return number;
}

uint64_t SecondsSince1970() {
  constexpr uint64_t kEpoch = 116444736000000000;  // 1970-01-01 as a FILETIME
  FILETIME now{};
  GetSystemTimeAsFileTime(&now);
  return ((uint64_t{now.dwHighDateTime} << 32 | now.dwLowDateTime) - kEpoch) / 10'000'000;
}

// Hashes a part of the source. False, and the error logged, when it has fewer bytes or cannot be read.
bool HashPart(UploadSource& source, uint64_t begin, uint64_t size, const CancelSignal& cancel, Digest& digest) {
  std::vector<char> buffer(static_cast<size_t>(std::min<uint64_t>(kHashBuffer, std::max<uint64_t>(size, 1))));
  for (uint64_t done = 0; done < size;) {
    const auto wanted = static_cast<size_t>(std::min<uint64_t>(buffer.size(), size - done));
    size_t count = 0;
    const DWORD error = source.ReadAt(begin + done, std::span(buffer).first(wanted), count);
    if (error != ERROR_SUCCESS || count == 0) {
      LOG_ERROR(kScope, L"the file to upload cannot be read to its end, error %u", error);
      return false;
    }
    digest.Add({buffer.data(), count});
    done += count;
    if (cancel.IsSet()) return false;
  }
  return true;
}

// The bytes of one PATCH.
class ChunkBody : public HttpBody {
 public:
  ChunkBody(UploadSource& source, uint64_t begin, uint32_t size, TransferProgress& progress)
      : m_source(source), m_begin(begin), m_size(size), m_progress(progress) {}

  uint32_t Size() const override { return m_size; }

  bool Read(uint32_t offset, std::span<char> buffer) override {
    while (!buffer.empty()) {
      size_t count = 0;
      const DWORD error = m_source.ReadAt(m_begin + offset, buffer, count);
      if (error != ERROR_SUCCESS || count == 0) {
        LOG_ERROR(kScope, L"the file to upload cannot be read at %llu, error %u: it changed or vanished",
                  m_begin + offset, error);
        return false;
      }
      offset += static_cast<uint32_t>(count);
      buffer = buffer.subspan(count);
    }
    return true;
  }

  // The last bytes of the file are only told when the server has confirmed them.
  bool Sent(uint32_t count) override {
    m_sent += count;
    const uint64_t position = m_begin + m_sent;
    return position >= m_source.Size() || m_progress.At(position);
  }

 private:
  UploadSource& m_source;
  const uint64_t m_begin;
  const uint32_t m_size;
  TransferProgress& m_progress;
  uint64_t m_sent = 0;
};

HttpHeaders ProtocolHeaders() {
  return {{"Tus-Resumable", "1.0.0"}};
}

std::string FileNameOf(const std::string& path) {
  std::wstring name(LastPathComponent(ToWide(path)));
  if (name.size() > kLongestFileName) name.erase(0, name.size() - kLongestFileName);
  return name.empty() ? "upload" : ToUtf8(name);
}

}  // namespace

TusUpload::TusUpload(HttpClient& client, const UploadConfig& config, const UploadRequest& request, UploadSource& source,
                     const CancelSignal& cancel)
    : m_client(client),
      m_config(config),
      m_request(request),
      m_source(source),
      m_cancel(cancel),
      m_progress(request, source.Size()),
      m_begin(GetTickCount64()),
      m_deadline(m_begin + config.timeouts.upload) {}

int32_t TusUpload::Run(UploadAnswer& answer) {
  m_client.SetDeadline(m_deadline);
  int32_t result = Prepare();
  if (result == QXSKYLANE_OK && !m_progress.At(0)) result = QXSKYLANE_CANCELLED;
  while (result == QXSKYLANE_OK && !IsDone()) {
    const Step step = Do(NextRequest());
    switch (step.verdict.next) {
      case TusNext::Proceed:
        result = TooLarge();
        break;
      case TusNext::BeginAnew:
        result = BeginAnew(step);
        break;
      case TusNext::AskOffset:
      case TusNext::Retry:
        result = WaitForRetry(step);
        break;
      case TusNext::GiveUp:
        result = GiveUp(step);
        break;
    }
  }
  answer.status = m_lastReply.status;
  answer.body = m_lastReply.body;
  if (result != QXSKYLANE_OK) return result;
  answer.location = AddressText(m_client.Server(), m_target);
  LogSuccess();
  m_progress.At(m_source.Size());
  return QXSKYLANE_OK;
}

// Reads the source once from begin to end: the server is told its hash before it gets the first byte.
int32_t TusUpload::Prepare() {
  Digest digest(BCRYPT_SHA256_ALGORITHM);
  if (!HashPart(m_source, 0, m_source.Size(), m_cancel, digest)) {
    return m_cancel.IsSet() ? QXSKYLANE_CANCELLED : QXSKYLANE_FILE_UNREADABLE;
  }
  m_sha256 = digest.Finish();
  if (!m_sha256.empty()) return QXSKYLANE_OK;
  LOG_ERROR(kScope, L"the system cannot compute a SHA-256");
  return QXSKYLANE_INTERNAL_ERROR;
}

TusRequest TusUpload::NextRequest() const {
  if (!m_capabilities) return TusRequest::Capabilities;
  if (m_target.empty()) return TusRequest::Create;
  return m_offset && *m_offset < m_source.Size() ? TusRequest::Chunk : TusRequest::Offset;
}

TusUpload::Step TusUpload::Do(TusRequest kind) {
  switch (kind) {
    case TusRequest::Create:
      return Create();
    case TusRequest::Offset:
      return AskOffset();
    case TusRequest::Chunk:
      return SendChunk();
    default:
      break;
  }
  HttpRequest request{MethodOf(kind), m_client.Server().target, ProtocolHeaders()};
  request.isAnonymous = true;
  HttpReply reply;
  Step step = Send(kind, request, reply);
  if (reply.status == 401 || reply.status == 403) {
    request.isAnonymous = false;
    step = Send(kind, request, reply);
  }
  if (reply.status == 0) return step;
  // A service, or something before it, that does not like the question is not asked again.
  m_capabilities = ReadCapabilities(reply.headers);
  return {{TusNext::Proceed, QXSKYLANE_OK, ""}};
}

// `reply` has the status 0 when there was none.
TusUpload::Step TusUpload::Send(TusRequest kind, const HttpRequest& request, HttpReply& reply) {
  const HttpOutcome outcome = m_client.Exchange(request, reply);
  if (outcome != HttpOutcome::Done) {
    reply = HttpReply();
    return StepOf(outcome);
  }
  m_lastReply = reply;
  Step step{JudgeStatus(kind, reply.status)};
  if (step.verdict.next == TusNext::Proceed) return step;
  if (kind != TusRequest::Capabilities) LogRefusal(kind, reply, step.verdict);
  if (const auto text = FindHeader(reply.headers, "Retry-After")) {
    step.retryAfter = ParseRetryAfter(*text, SecondsSince1970()).value_or(0);
  }
  return step;
}

TusUpload::Step TusUpload::StepOf(HttpOutcome outcome) {
  switch (outcome) {
    case HttpOutcome::NoConnection:
      return {
          {TusNext::Retry, QXSKYLANE_NO_CONNECTION, "check the network, the proxy and \"endpoint\" of qxlink.json"}};
    case HttpOutcome::Broken:
      return {{TusNext::Retry, QXSKYLANE_NO_CONNECTION, "the connection broke"}};
    case HttpOutcome::TimedOut:
      return {{TusNext::Retry, QXSKYLANE_TIMED_OUT, "the network or the service is too slow"}};
    case HttpOutcome::NoSecureChannel:  // a line that broke while TLS began looks the same
      return {{m_failures + 1 < kMostTlsFailures ? TusNext::Retry : TusNext::GiveUp, QXSKYLANE_NO_SECURE_CHANNEL,
               "check the service's certificate and what inspects the traffic on the way"}};
    case HttpOutcome::BadCertificate:
      return {{TusNext::GiveUp, QXSKYLANE_NO_SECURE_CHANNEL, "check its certificate"}};
    case HttpOutcome::BadSource:
      return {{TusNext::GiveUp, QXSKYLANE_FILE_UNREADABLE, ""}};
    default:
      return {{TusNext::GiveUp, QXSKYLANE_CANCELLED, ""}};
  }
}

TusUpload::Step TusUpload::Create() {
  HttpRequest request{MethodOf(TusRequest::Create), m_client.Server().target, ProtocolHeaders()};
  std::string tags = m_request.tags.isNull() ? "{}" : WriteCompactJson(m_request.tags);
  while (tags.ends_with('\n'))
    tags.pop_back();
  request.headers.emplace_back("Upload-Length", std::to_string(m_source.Size()));
  request.headers.emplace_back("Upload-Metadata",
                               EncodeMetadata(FileNameOf(m_request.filePath), m_request.category, tags, m_sha256));
  HttpReply reply;
  const Step step = Send(TusRequest::Create, request, reply);
  if (step.verdict.next != TusNext::Proceed) return step;
  const auto target = ResolveLocation(m_client.Server(), FindHeader(reply.headers, "Location").value_or(""));
  if (!target) {
    LOG_ERROR(kScope, L"the service names no place for the upload, or one at another host; nothing was sent there");
    return {
        {TusNext::GiveUp, QXSKYLANE_SERVICE_FAILED, "put the service's own address into \"endpoint\" of qxlink.json"}};
  }
  m_target = *target;
  m_offset = 0;
  m_isConfirmed = false;
  return step;
}

TusUpload::Step TusUpload::AskOffset() {
  HttpReply reply;
  const Step step = Send(TusRequest::Offset, {MethodOf(TusRequest::Offset), m_target, ProtocolHeaders()}, reply);
  if (step.verdict.next != TusNext::Proceed) return step;
  const Step learned = Learn(reply);
  if (m_offset && m_attempts > 1 && *m_offset != 0 && !IsDone()) {
    m_resumed = std::max(m_resumed, *m_offset);
    LOG_INFO(kScope, L"the upload goes on at %llu of %llu bytes", *m_offset, m_source.Size());
  }
  return learned;
}

TusUpload::Step TusUpload::SendChunk() {
  if (m_sendingSince == 0) m_sendingSince = GetTickCount64();
  const uint64_t begin = *m_offset;
  const auto size = static_cast<uint32_t>(std::min(m_config.chunkSize, m_source.Size() - begin));
  HttpRequest request{MethodOf(TusRequest::Chunk), m_target, ProtocolHeaders()};
  request.headers.emplace_back("Upload-Offset", std::to_string(begin));
  request.headers.emplace_back("Content-Type", "application/offset+octet-stream");
  if (!m_capabilities->checksumAlgorithm.empty()) {
    const auto checksum = ChecksumOf(begin, size);
    if (!checksum) return StepOf(m_cancel.IsSet() ? HttpOutcome::Cancelled : HttpOutcome::BadSource);
    request.headers.emplace_back("Upload-Checksum", m_capabilities->checksumAlgorithm + " " + *checksum);
  }
  ChunkBody body(m_source, begin, size, m_progress);
  request.body = &body;
  m_offset.reset();  // whatever happens now, the server knows better
  HttpReply reply;
  const Step step = Send(TusRequest::Chunk, request, reply);
  if (step.verdict.next != TusNext::Proceed) return step;
  const Step learned = Learn(reply);
  if (!m_offset || *m_offset > begin) return learned;
  LOG_WARNING(kScope, L"the service took nothing of what was sent, it still has %llu bytes", *m_offset);
  return {{TusNext::Retry, QXSKYLANE_SERVICE_FAILED, "the service takes no bytes"}};
}

std::optional<std::string> TusUpload::ChecksumOf(uint64_t begin, uint64_t size) {
  const bool isSha1 = m_capabilities->checksumAlgorithm == "sha1";
  Digest digest(isSha1 ? BCRYPT_SHA1_ALGORITHM : BCRYPT_SHA256_ALGORITHM);
  if (!HashPart(m_source, begin, size, m_cancel, digest)) return std::nullopt;
  return Base64(digest.FinishBytes());
}

// Takes the offset from an answer.
TusUpload::Step TusUpload::Learn(const HttpReply& reply) {
  m_offset = ReadOffset(reply.headers, m_source.Size());
  if (!m_offset) {
    LOG_ERROR(kScope, L"the service does not say how much it has, or says what cannot be");
    return {{TusNext::GiveUp, QXSKYLANE_SERVICE_FAILED, "ask who runs the service"}};
  }
  m_isConfirmed = true;
  if (*m_offset > m_best) m_failures = 0;
  m_best = std::max(m_best, *m_offset);
  return {{TusNext::Proceed, QXSKYLANE_OK, ""}};
}

// A service, or one that repeats what it was sent, might say what must not stand in a log.
void TusUpload::LogRefusal(TusRequest kind, const HttpReply& reply, const TusVerdict& verdict) const {
  std::string text = LoggableText(reply.body);
  for (const auto& header : m_config.headers) {
    if (!header.second.empty() && reply.body.find(header.second) != std::string::npos) text = "(not shown)";
  }
  LOG_WARNING(kScope, L"the service answered %s with %u \"%S\": %S", MethodOf(kind), reply.status, text.c_str(),
              verdict.advice);
}

int32_t TusUpload::GiveUp(const Step& step) const {
  if (*step.verdict.advice != '\0') LOG_ERROR(kScope, L"given up: %S", step.verdict.advice);
  return step.verdict.result;
}

// Once. The file may have changed: it is read again.
int32_t TusUpload::BeginAnew(const Step& step) {
  if (std::exchange(m_hasBegunAnew, true)) return GiveUp(step);
  LOG_INFO(kScope, L"the upload begins anew");
  m_target.clear();
  m_offset.reset();
  m_best = 0;
  m_isConfirmed = false;
  ++m_attempts;
  return Prepare();
}

int32_t TusUpload::WaitForRetry(const Step& step) {
  if (++m_failures > m_config.retries) {
    LOG_ERROR(kScope, L"given up after %u attempts: %S", m_attempts, step.verdict.advice);
    return step.verdict.result;
  }
  const ULONGLONG now = GetTickCount64();
  const uint64_t left = m_deadline > now ? m_deadline - now : 0;
  const uint64_t asked = std::min<uint64_t>(step.retryAfter, left / 1000 + 1) * 1000;
  const uint64_t delay = std::max(RetryDelay(m_failures, m_config.retryDelay, RandomNumber()), asked);
  if (delay >= left) {
    LOG_ERROR(kScope, L"given up, no time is left for another attempt: %S", step.verdict.advice);
    return left == 0 ? static_cast<int32_t>(QXSKYLANE_TIMED_OUT) : step.verdict.result;
  }
  LOG_INFO(kScope, L"attempt %u in %llu ms", m_attempts + 1, delay);
  if (m_cancel.Wait(static_cast<DWORD>(delay))) return QXSKYLANE_CANCELLED;
  ++m_attempts;
  return QXSKYLANE_OK;
}

int32_t TusUpload::TooLarge() const {
  const auto limit = m_capabilities ? m_capabilities->maxSize : std::nullopt;
  if (!limit || m_source.Size() <= *limit) return QXSKYLANE_OK;
  LOG_ERROR(kScope, L"the file has %llu bytes, the service takes at most %llu; lower the size limit of the package",
            m_source.Size(), *limit);
  return QXSKYLANE_SERVICE_REFUSED;
}

void TusUpload::LogSuccess() const {
  const ULONGLONG now = GetTickCount64();
  const uint64_t sending = std::max<uint64_t>(1, m_sendingSince == 0 ? 0 : now - m_sendingSince);
  LOG_INFO(kScope, L"%llu bytes are with the service after %llu ms: %llu KiB/s, %u attempts, %llu bytes resumed",
           m_source.Size(), now - m_begin, m_source.Size() * 1000 / sending / 1024, m_attempts, m_resumed);
}

}  // namespace qxlink
