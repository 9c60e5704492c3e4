#include "companions/upload/http_client.h"

#include <algorithm>

#include "companions/upload/http_request_state.h"
#include "core/format.h"
#include "core/logging.h"
#include "core/text.h"

namespace qxlink {
namespace {

constexpr wchar_t kScope[] = L"qxlink::HttpClient";
constexpr wchar_t kAgent[] = L"qxlink/1.0";
constexpr size_t kMostOfBody = size_t{64} << 10;
constexpr DWORD kMostOfHeaders = 64 << 10;       // bytes
constexpr DWORD kLettingGo = 1000;               // milliseconds
constexpr DWORD kSocketTimedOut = WSAETIMEDOUT;  // what some versions of the system report instead of their own number

bool SetNumber(HINTERNET handle, DWORD option, DWORD value) {
  return WinHttpSetOption(handle, option, &value, sizeof value) != FALSE;
}

bool IsTlsError(DWORD error) {
  constexpr DWORD kErrors[] = {ERROR_WINHTTP_SECURE_FAILURE,           ERROR_WINHTTP_SECURE_CHANNEL_ERROR,
                               ERROR_WINHTTP_SECURE_CERT_DATE_INVALID, ERROR_WINHTTP_SECURE_CERT_CN_INVALID,
                               ERROR_WINHTTP_SECURE_INVALID_CA,        ERROR_WINHTTP_SECURE_CERT_REV_FAILED,
                               ERROR_WINHTTP_SECURE_INVALID_CERT,      ERROR_WINHTTP_SECURE_CERT_REVOKED,
                               ERROR_WINHTTP_SECURE_CERT_WRONG_USAGE,  ERROR_WINHTTP_CLIENT_AUTH_CERT_NEEDED};
  return std::find(std::begin(kErrors), std::end(kErrors), error) != std::end(kErrors);
}

std::wstring HeaderText(const HttpRequest& request, const UploadConfig& config) {
  std::string text;
  const auto add = [&text](const HttpHeaders& headers) {
    for (const auto& [name, value] : headers)
      text.append(name).append(": ").append(value).append("\r\n");
  };
  add(request.headers);
  if (!request.isAnonymous) add(config.headers);
  return ToWide(text);
}

DWORD Limited(uint64_t milliseconds) {
  return static_cast<DWORD>(std::min<uint64_t>(milliseconds, 0x7FFFFFFF));
}

}  // namespace

HttpClient::HttpClient(HttpAddress server, const UploadConfig& config, const ServerTrust* trust,
                       const CancelSignal& cancel)
    : m_server(std::move(server)), m_config(config), m_trust(trust), m_cancel(cancel) {}

HttpClient::~HttpClient() {
  m_connection.Reset();
  m_session.Reset();
  // Once the library is unloaded nobody may call into it any more. If the system does not let go of a request in time,
  // the library stays for the rest of the process.
  const bool isFree = std::all_of(m_abandoned.begin(), m_abandoned.end(), [](const auto& state) {
    return WaitForSingleObject(state->ClosedEvent(), kLettingGo) == WAIT_OBJECT_0;
  });
  if (isFree) return;
  HMODULE pinned = nullptr;
  GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_PIN | GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS,
                     reinterpret_cast<LPCWSTR>(&HttpRequestState::OnStatus), &pinned);
}

DWORD HttpClient::OpenSession() {
  const bool isNamed = m_config.proxy != "system" && m_config.proxy != "none";
  const std::wstring proxy = ToWide(m_config.proxy);
  const DWORD access = isNamed                      ? WINHTTP_ACCESS_TYPE_NAMED_PROXY
                       : m_config.proxy == "system" ? WINHTTP_ACCESS_TYPE_AUTOMATIC_PROXY
                                                    : WINHTTP_ACCESS_TYPE_NO_PROXY;
  m_session.Reset(WinHttpOpen(kAgent, access, isNamed ? proxy.c_str() : WINHTTP_NO_PROXY_NAME, WINHTTP_NO_PROXY_BYPASS,
                              WINHTTP_FLAG_ASYNC));
  // Before Windows 8.1 there is no automatic proxy, only the one that was set for WinHTTP.
  if (!m_session && GetLastError() == ERROR_INVALID_PARAMETER && access == WINHTTP_ACCESS_TYPE_AUTOMATIC_PROXY) {
    m_session.Reset(WinHttpOpen(kAgent, WINHTTP_ACCESS_TYPE_DEFAULT_PROXY, WINHTTP_NO_PROXY_NAME,
                                WINHTTP_NO_PROXY_BYPASS, WINHTTP_FLAG_ASYNC));
  }
  return m_session ? ERROR_SUCCESS : GetLastError();
}

DWORD HttpClient::Open() {
  if (const DWORD error = OpenSession(); error != ERROR_SUCCESS) return error;
  const auto milliseconds = [](uint64_t value) { return static_cast<int>(Limited(value)); };
  const UploadTimeouts& timeouts = m_config.timeouts;
  if (!WinHttpSetTimeouts(m_session.Get(), milliseconds(timeouts.connect), milliseconds(timeouts.connect),
                          milliseconds(timeouts.send), milliseconds(timeouts.receive)) ||
      !SetNumber(m_session.Get(), WINHTTP_OPTION_RECEIVE_RESPONSE_TIMEOUT, Limited(timeouts.receive))) {
    LOG_WARNING(L"qxlink::HttpClient::Open", L"the time-outs are the system's own, error %u", GetLastError());
  }
  DWORD protocols = WINHTTP_FLAG_SECURE_PROTOCOL_TLS1_2 | WINHTTP_FLAG_SECURE_PROTOCOL_TLS1_3;
  if (!WinHttpSetOption(m_session.Get(), WINHTTP_OPTION_SECURE_PROTOCOLS, &protocols, sizeof protocols) &&
      !SetNumber(m_session.Get(), WINHTTP_OPTION_SECURE_PROTOCOLS, WINHTTP_FLAG_SECURE_PROTOCOL_TLS1_2)) {
    return GetLastError();
  }
  if (WinHttpSetStatusCallback(m_session.Get(), &HttpRequestState::OnStatus, HttpRequestState::kNotifications, 0) ==
      WINHTTP_INVALID_STATUS_CALLBACK) {
    return GetLastError();
  }
  const bool isIpv6 = m_server.host.find(':') != std::string::npos;
  const std::string host = isIpv6 ? "[" + m_server.host + "]" : m_server.host;
  m_connection.Reset(WinHttpConnect(m_session.Get(), ToWide(host).c_str(), m_server.port, 0));
  return m_connection ? ERROR_SUCCESS : GetLastError();
}

std::shared_ptr<HttpRequestState> HttpClient::OpenRequest(const HttpRequest& request) {
  const DWORD flags = WINHTTP_FLAG_ESCAPE_DISABLE | (m_server.isSecure ? WINHTTP_FLAG_SECURE : 0);
  const HINTERNET handle = WinHttpOpenRequest(m_connection.Get(), request.method, ToWide(request.target).c_str(),
                                              nullptr, WINHTTP_NO_REFERER, WINHTTP_DEFAULT_ACCEPT_TYPES, flags);
  if (handle == nullptr) return nullptr;
  const bool checksItself = m_server.isSecure && m_trust != nullptr;
  auto state = HttpRequestState::Make(handle, checksItself ? m_trust : nullptr, ToWide(m_server.host));
  if (!state) return nullptr;
  // A request that cannot be restricted so is none: it could lead a package elsewhere. The user's own credentials are
  // for a proxy, never for the service.
  const bool isRestricted =
      SetNumber(handle, WINHTTP_OPTION_DISABLE_FEATURE, WINHTTP_DISABLE_REDIRECTS | WINHTTP_DISABLE_COOKIES) &&
      SetNumber(handle, WINHTTP_OPTION_AUTOLOGON_POLICY, WINHTTP_AUTOLOGON_SECURITY_LEVEL_HIGH) &&
      (!checksItself || SetNumber(handle, WINHTTP_OPTION_SECURITY_FLAGS, SECURITY_FLAG_IGNORE_UNKNOWN_CA));
  if (isRestricted) return state;
  const DWORD error = GetLastError();
  state->Close();
  SetLastError(error);
  return nullptr;
}

HttpOutcome HttpClient::Exchange(const HttpRequest& request, HttpReply& reply) {
  reply = HttpReply();
  if (m_cancel.IsSet()) return HttpOutcome::Cancelled;
  const std::shared_ptr<HttpRequestState> state = OpenRequest(request);
  if (!state) {
    LOG_WARNING(kScope, L"the request cannot be made, error %u", GetLastError());
    return HttpOutcome::Broken;
  }
  HttpOutcome outcome = SendHead(*state, request);
  if (outcome == HttpOutcome::Done && request.body != nullptr) outcome = SendBody(*state, *request.body);
  if (outcome == HttpOutcome::Done) outcome = Receive(*state, reply);
  state->Close();
  if (WaitForSingleObject(state->ClosedEvent(), 0) != WAIT_OBJECT_0) m_abandoned.push_back(state);
  return outcome;
}

HttpOutcome HttpClient::SendHead(HttpRequestState& state, const HttpRequest& request) const {
  const std::wstring headers = HeaderText(request, m_config);
  const DWORD length = request.body != nullptr ? request.body->Size() : 0;
  const BOOL started = WinHttpSendRequest(state.Handle(), headers.c_str(), static_cast<DWORD>(headers.size()),
                                          WINHTTP_NO_REQUEST_DATA, 0, length, 0);
  return Await(state, started, Phase::Connect);
}

// The next piece is read while the network takes the one before.
HttpOutcome HttpClient::SendBody(HttpRequestState& state, HttpBody& body) const {
  const uint32_t size = body.Size();
  const auto piece = [size](uint32_t offset) {
    return std::min<uint32_t>(size - offset, static_cast<uint32_t>(HttpRequestState::kBufferSize));
  };
  unsigned current = 0;
  const auto read = [&](unsigned index, uint32_t offset) {
    return body.Read(offset, std::span(state.buffers[index]).first(piece(offset)));
  };
  if (size != 0 && !read(current, 0)) return HttpOutcome::BadSource;
  for (uint32_t offset = 0; offset < size;) {
    const uint32_t count = piece(offset);
    const BOOL started = WinHttpWriteData(state.Handle(), state.buffers[current].data(), count, nullptr);
    const bool isReady = !started || offset + count == size || read(1 - current, offset + count);
    const HttpOutcome outcome = Await(state, started, Phase::Send);
    if (outcome != HttpOutcome::Done) return outcome;
    if (!isReady) return HttpOutcome::BadSource;
    if (!body.Sent(count)) return HttpOutcome::Cancelled;
    offset += count;
    current = 1 - current;
  }
  return HttpOutcome::Done;
}

HttpOutcome HttpClient::Receive(HttpRequestState& state, HttpReply& reply) const {
  HttpOutcome outcome = Await(state, WinHttpReceiveResponse(state.Handle(), nullptr), Phase::Receive);
  if (outcome != HttpOutcome::Done) return outcome;
  DWORD status = 0;
  DWORD size = sizeof status;
  std::wstring headers(kMostOfHeaders / sizeof(wchar_t), L'\0');
  DWORD headerSize = kMostOfHeaders;
  if (!WinHttpQueryHeaders(state.Handle(), WINHTTP_QUERY_STATUS_CODE | WINHTTP_QUERY_FLAG_NUMBER,
                           WINHTTP_HEADER_NAME_BY_INDEX, &status, &size, WINHTTP_NO_HEADER_INDEX) ||
      !WinHttpQueryHeaders(state.Handle(), WINHTTP_QUERY_RAW_HEADERS_CRLF, WINHTTP_HEADER_NAME_BY_INDEX, headers.data(),
                           &headerSize, WINHTTP_NO_HEADER_INDEX)) {
    return Failure(state, GetLastError(), Phase::Receive);
  }
  headers.resize(headerSize / sizeof(wchar_t));
  reply.status = status;
  reply.headers = ParseHeaderLines(ToUtf8(headers));
  while (reply.body.size() < kMostOfBody) {
    std::vector<char>& buffer = state.buffers[0];
    const auto wanted = static_cast<DWORD>(std::min(buffer.size(), kMostOfBody - reply.body.size()));
    outcome = Await(state, WinHttpReadData(state.Handle(), buffer.data(), wanted, nullptr), Phase::Receive);
    if (outcome != HttpOutcome::Done) return outcome;
    if (state.Count() == 0) break;
    reply.body.append(buffer.data(), std::min<size_t>(state.Count(), wanted));
  }
  return HttpOutcome::Done;
}

// Waits for the operation that was `started`; if it was not, the thread's last error says why.
HttpOutcome HttpClient::Await(HttpRequestState& state, BOOL started, Phase phase) const {
  if (!started) return Failure(state, GetLastError(), phase);
  const UploadTimeouts& timeouts = m_config.timeouts;
  const uint64_t limit = phase == Phase::Connect ? timeouts.connect * 2
                         : phase == Phase::Send  ? timeouts.send
                                                 : timeouts.receive;
  const ULONGLONG now = GetTickCount64();
  const HANDLE events[] = {state.DoneEvent(), m_cancel.Event()};
  const DWORD wait = Limited(m_deadline > now ? std::min<uint64_t>(limit, m_deadline - now) : 0);
  switch (WaitForMultipleObjects(2, events, FALSE, wait)) {
    case WAIT_OBJECT_0:
      return state.Error() == ERROR_SUCCESS ? HttpOutcome::Done : Failure(state, state.Error(), phase);
    case WAIT_OBJECT_0 + 1:
      return HttpOutcome::Cancelled;
    default:
      break;
  }
  const HttpOutcome outcome = Failure(state, ERROR_WINHTTP_TIMEOUT, phase);
  // The system itself gives up a line that does not come about, and in half of this time. So the line stands, and what
  // does not come about is TLS.
  const bool isStuckInTls = phase == Phase::Connect && wait == limit && m_server.isSecure && !state.IsSending();
  return isStuckInTls ? HttpOutcome::NoSecureChannel : outcome;
}

HttpOutcome HttpClient::Failure(const HttpRequestState& state, DWORD error, Phase phase) const {
  const wchar_t* const what = phase == Phase::Connect ? L"reaching the service"
                              : phase == Phase::Send  ? L"sending to the service"
                                                      : L"waiting for the service's answer";
  if (state.TrustError() != ERROR_SUCCESS) {
    LOG_WARNING(kScope, L"the service's certificate does not hold by \"ca_file\" of qxlink.json, error 0x%08X",
                state.TrustError());
    return HttpOutcome::BadCertificate;
  }
  LOG_WARNING(kScope, L"%s failed, error %u, certificate flags 0x%X", what, error, state.SystemComplaints());
  if (error == ERROR_WINHTTP_TIMEOUT || error == kSocketTimedOut) return HttpOutcome::TimedOut;
  if (error == ERROR_WINHTTP_CANNOT_CONNECT || error == ERROR_WINHTTP_NAME_NOT_RESOLVED)
    return HttpOutcome::NoConnection;
  if (!IsTlsError(error) || phase != Phase::Connect) return HttpOutcome::Broken;
  return state.SystemComplaints() != 0 ? HttpOutcome::BadCertificate : HttpOutcome::NoSecureChannel;
}

}  // namespace qxlink
