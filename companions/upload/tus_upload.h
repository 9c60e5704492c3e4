// One upload to a tus 1.0 server: made, sent in chunks, resumed after whatever breaks, and called done only when the
// server said that it has every byte.
#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>

#include "companions/upload/http_client.h"
#include "companions/upload/transfer_progress.h"
#include "companions/upload/tus_protocol.h"
#include "companions/upload/upload_config.h"
#include "companions/upload/upload_request.h"
#include "companions/upload/upload_source.h"

namespace qxlink {

// What the server said last, and where the upload lies; for the caller's response.
struct UploadAnswer {
  unsigned status = 0;   // 0: no service was involved, or none answered
  std::string location;  // an address, or a path in the outbox; empty: nowhere
  std::string body;
};

class TusUpload {
 public:
  // All of them must outlive this object.
  TusUpload(HttpClient& client, const UploadConfig& config, const UploadRequest& request, UploadSource& source,
            const CancelSignal& cancel);

  // Sends it all; once. A QxskylaneResult; whatever failed is in the log.
  int32_t Run(UploadAnswer& answer);

  // In lower-case hexadecimal digits; empty until Run has read the source.
  const std::string& Sha256() const { return m_sha256; }

 private:
  struct Step {
    TusVerdict verdict;
    uint64_t retryAfter = 0;  // seconds that the server asked for
  };

  int32_t Prepare();
  TusRequest NextRequest() const;
  bool IsDone() const { return m_offset == m_source.Size() && m_isConfirmed; }
  Step Do(TusRequest kind);
  Step Create();
  Step AskOffset();
  Step SendChunk();
  Step Learn(const HttpReply& reply);
  Step Send(TusRequest kind, const HttpRequest& request, HttpReply& reply);
  Step StepOf(HttpOutcome outcome);
  std::optional<std::string> ChecksumOf(uint64_t begin, uint64_t size);
  void LogRefusal(TusRequest kind, const HttpReply& reply, const TusVerdict& verdict) const;
  int32_t GiveUp(const Step& step) const;
  int32_t BeginAnew(const Step& step);
  int32_t WaitForRetry(const Step& step);
  int32_t TooLarge() const;
  void LogSuccess() const;

  HttpClient& m_client;
  const UploadConfig& m_config;
  const UploadRequest& m_request;
  UploadSource& m_source;
  const CancelSignal& m_cancel;
  TransferProgress m_progress;

  const ULONGLONG m_begin;  // milliseconds of the system timer, as the deadline
  const ULONGLONG m_deadline;
  ULONGLONG m_sendingSince = 0;
  std::string m_sha256;
  std::optional<TusCapabilities> m_capabilities;
  std::string m_target;              // of the upload; empty: there is none
  std::optional<uint64_t> m_offset;  // how much the server has; nothing: it has to be asked
  bool m_isConfirmed = false;        // the offset is from an answer to bytes or to a question
  uint64_t m_best = 0;               // the greatest offset so far
  uint64_t m_resumed = 0;            // bytes that were there when an attempt began after another
  unsigned m_failures = 0;           // in a row, nothing new having arrived
  unsigned m_attempts = 1;
  bool m_hasBegunAnew = false;
  HttpReply m_lastReply;
};

}  // namespace qxlink
