// One request after another to one server, over WinHTTP. Every wait has a limit of its own and ends when the work is
// cancelled or its deadline is over, whatever the server does.
#pragma once

#include <windows.h>
// windows.h has to come first.
#include <winhttp.h>

#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "companions/upload/cancel_signal.h"
#include "companions/upload/http_text.h"
#include "companions/upload/server_trust.h"
#include "companions/upload/upload_config.h"
#include "core/scoped.h"

namespace qxlink {

struct InternetHandleTraits {
  using Type = HINTERNET;
  static bool IsValid(Type handle) { return handle != nullptr; }
  static void Close(Type handle) { WinHttpCloseHandle(handle); }
};
using InternetHandle = Scoped<InternetHandleTraits>;

enum class HttpOutcome {
  Done,             // there is an answer, of whatever status
  NoConnection,     // the server cannot be reached
  NoSecureChannel,  // TLS came to nothing, perhaps because the line broke
  BadCertificate,   // the server is not the one it says, or not trusted
  TimedOut,
  Broken,     // the connection was lost, or what came is no HTTP
  BadSource,  // the body cannot be read
  Cancelled,
};

// What a request carries.
class HttpBody {
 public:
  virtual ~HttpBody() = default;
  virtual uint32_t Size() const = 0;  // bytes
  // Fills the whole buffer from `offset` on; false when that cannot be.
  virtual bool Read(uint32_t offset, std::span<char> buffer) = 0;
  // The network has taken so many bytes more. False cancels.
  virtual bool Sent(uint32_t count) = 0;
};

struct HttpRequest {
  const wchar_t* method = L"GET";
  std::string target;
  HttpHeaders headers;
  HttpBody* body = nullptr;  // or null
  // Without the configured headers. The first request to a server should be: should anything of it be out before the
  // server's certificate was found wanting, it told nothing.
  bool isAnonymous = false;
};

struct HttpReply {
  unsigned status = 0;
  HttpHeaders headers;
  std::string body;  // at most its first 64 KiB
};

class HttpRequestState;

// For one thread. Failures are logged here, as warnings: whether they matter is for the caller to say.
class HttpClient {
 public:
  // `trust` null: what Windows trusts. `trust` and `cancel` must outlive the client.
  HttpClient(HttpAddress server, const UploadConfig& config, const ServerTrust* trust, const CancelSignal& cancel);
  ~HttpClient();
  HttpClient(const HttpClient&) = delete;
  HttpClient& operator=(const HttpClient&) = delete;

  // First. A Windows error number.
  DWORD Open();

  // No wait lasts beyond this moment of GetTickCount64.
  void SetDeadline(ULONGLONG deadline) { m_deadline = deadline; }

  HttpOutcome Exchange(const HttpRequest& request, HttpReply& reply);

  const HttpAddress& Server() const { return m_server; }

 private:
  enum class Phase { Connect, Send, Receive };

  DWORD OpenSession();
  std::shared_ptr<HttpRequestState> OpenRequest(const HttpRequest& request);
  HttpOutcome SendHead(HttpRequestState& state, const HttpRequest& request) const;
  HttpOutcome SendBody(HttpRequestState& state, HttpBody& body) const;
  HttpOutcome Receive(HttpRequestState& state, HttpReply& reply) const;
  HttpOutcome Await(HttpRequestState& state, BOOL started, Phase phase) const;
  HttpOutcome Failure(const HttpRequestState& state, DWORD error, Phase phase) const;

  const HttpAddress m_server;
  const UploadConfig& m_config;
  const ServerTrust* const m_trust;
  const CancelSignal& m_cancel;
  ULONGLONG m_deadline = ~ULONGLONG{0};
  InternetHandle m_session;
  InternetHandle m_connection;
  std::vector<std::shared_ptr<HttpRequestState>> m_abandoned;  // the system still works on them
};

}  // namespace qxlink
