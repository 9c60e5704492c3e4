#include "companions/upload/http_request_state.h"

#include <map>
#include <mutex>
#include <utility>

namespace qxlink {
namespace {

// The requests that the system may still call about, by the number that it was given for each.
class Registry {
 public:
  DWORD_PTR Add(std::shared_ptr<HttpRequestState> state) {
    const std::lock_guard lock(m_lock);
    m_states.emplace(++m_last, std::move(state));
    return m_last;
  }
  std::shared_ptr<HttpRequestState> Find(DWORD_PTR number) {
    const std::lock_guard lock(m_lock);
    const auto found = m_states.find(number);
    return found == m_states.end() ? nullptr : found->second;
  }
  void Remove(DWORD_PTR number) {
    const std::lock_guard lock(m_lock);
    m_states.erase(number);
  }

 private:
  SharedLock m_lock;
  DWORD_PTR m_last = 0;
  std::map<DWORD_PTR, std::shared_ptr<HttpRequestState>> m_states;
};

Registry& Requests() {
  static Registry registry;
  return registry;
}

}  // namespace

std::shared_ptr<HttpRequestState> HttpRequestState::Make(HINTERNET request, const ServerTrust* trust,
                                                         std::wstring host) {
  auto state = std::make_shared<HttpRequestState>();
  state->m_handle = request;
  state->m_trust = trust;
  state->m_host = std::move(host);
  state->m_done.Reset(CreateEventW(nullptr, FALSE, FALSE, nullptr));
  state->m_closed.Reset(CreateEventW(nullptr, TRUE, FALSE, nullptr));
  DWORD_PTR number = state->m_done && state->m_closed ? Requests().Add(state) : 0;
  if (number != 0 && WinHttpSetOption(request, WINHTTP_OPTION_CONTEXT_VALUE, &number, sizeof number)) return state;
  const DWORD error = GetLastError();
  if (number != 0) Requests().Remove(number);
  WinHttpCloseHandle(std::exchange(state->m_handle, nullptr));
  SetLastError(error);
  return nullptr;
}

void CALLBACK HttpRequestState::OnStatus(HINTERNET handle, DWORD_PTR context, DWORD status, void* information,
                                         DWORD length) {
  const std::shared_ptr<HttpRequestState> state = Requests().Find(context);
  if (!state) return;
  switch (status) {
    case WINHTTP_CALLBACK_STATUS_SENDING_REQUEST:
      state->m_isSending = true;
      if (state->m_trust != nullptr) state->CheckCertificate(handle);
      break;
    case WINHTTP_CALLBACK_STATUS_SECURE_FAILURE:
      if (information != nullptr && length >= sizeof(DWORD)) {
        state->m_systemComplaints = *static_cast<const DWORD*>(information);
      }
      break;
    case WINHTTP_CALLBACK_STATUS_SENDREQUEST_COMPLETE:
    case WINHTTP_CALLBACK_STATUS_HEADERS_AVAILABLE:
    case WINHTTP_CALLBACK_STATUS_WRITE_COMPLETE:
      state->Finish(ERROR_SUCCESS, 0);
      break;
    case WINHTTP_CALLBACK_STATUS_READ_COMPLETE:
      state->Finish(ERROR_SUCCESS, length);
      break;
    case WINHTTP_CALLBACK_STATUS_REQUEST_ERROR:
      state->Finish(static_cast<const WINHTTP_ASYNC_RESULT*>(information)->dwError, 0);
      break;
    case WINHTTP_CALLBACK_STATUS_HANDLE_CLOSING:
      state->Finish(ERROR_WINHTTP_OPERATION_CANCELLED, 0);
      SetEvent(state->m_closed.Get());
      Requests().Remove(context);
      break;
    default:
      break;
  }
}

void HttpRequestState::Close() {
  HINTERNET handle = nullptr;
  {
    const std::lock_guard lock(m_lock);
    handle = std::exchange(m_handle, nullptr);
  }
  // The system may call back from within.
  if (handle != nullptr) WinHttpCloseHandle(handle);
}

void HttpRequestState::Finish(DWORD error, DWORD count) {
  m_error = error;
  m_count = count;
  SetEvent(m_done.Get());
}

// TLS stands, and nothing of the request has left yet: the last moment to end it.
void HttpRequestState::CheckCertificate(HINTERNET handle) {
  Certificate certificate;
  DWORD size = sizeof(PCCERT_CONTEXT);
  DWORD error = ERROR_SUCCESS;
  if (!WinHttpQueryOption(handle, WINHTTP_OPTION_SERVER_CERT_CONTEXT, static_cast<void*>(certificate.Receive()),
                          &size)) {
    error = GetLastError();
  } else {
    error = m_trust->Check(certificate.Get(), m_host);
  }
  if (error == ERROR_SUCCESS) return;
  m_trustError = error;
  Finish(ERROR_WINHTTP_SECURE_FAILURE, 0);
  Close();
}

}  // namespace qxlink
