// A request under way: what the thread that waits for it and the system's threads that carry it out share. The system
// may use the buffers until it has said that the handle is closed, however long ago nobody waits any more; until then
// the state is kept by a list of its own.
#pragma once

#include <windows.h>
// windows.h has to come first.
#include <winhttp.h>

#include <array>
#include <atomic>
#include <memory>
#include <string>
#include <vector>

#include "companions/upload/server_trust.h"
#include "core/lock.h"
#include "core/scoped.h"

namespace qxlink {

class HttpRequestState {
 public:
  // Takes the handle. `trust` null: the system decides about the server's certificate.
  static std::shared_ptr<HttpRequestState> Make(HINTERNET request, const ServerTrust* trust, std::wstring host);

  // For WinHttpSetStatusCallback of the session.
  static void CALLBACK OnStatus(HINTERNET handle, DWORD_PTR context, DWORD status, void* information, DWORD length);
  static constexpr DWORD kNotifications = WINHTTP_CALLBACK_FLAG_ALL_COMPLETIONS | WINHTTP_CALLBACK_FLAG_HANDLES |
                                          WINHTTP_CALLBACK_FLAG_SECURE_FAILURE | WINHTTP_CALLBACK_FLAG_SEND_REQUEST;

  HINTERNET Handle() const { return m_handle; }  // null once closed
  HANDLE DoneEvent() const { return m_done.Get(); }
  HANDLE ClosedEvent() const { return m_closed.Get(); }

  // What the operation that has ended came to: its error, and for a read its bytes.
  DWORD Error() const { return m_error; }
  DWORD Count() const { return m_count; }

  // What is wrong with the server's certificate: WINHTTP_CALLBACK_STATUS_FLAG_… bits, and the error of our own check.
  DWORD SystemComplaints() const { return m_systemComplaints; }
  DWORD TrustError() const { return m_trustError; }

  // The request itself is on its way: a connection stands, with TLS if that was wanted.
  bool IsSending() const { return m_isSending; }

  // Ends whatever is under way. The system says later that it is over.
  void Close();

  static constexpr size_t kBufferSize = size_t{1} << 20;
  std::array<std::vector<char>, 2> buffers{std::vector<char>(kBufferSize), std::vector<char>(kBufferSize)};

 private:
  void Finish(DWORD error, DWORD count);
  void CheckCertificate(HINTERNET handle);

  const ServerTrust* m_trust = nullptr;
  std::wstring m_host;
  SharedLock m_lock;
  HINTERNET m_handle = nullptr;
  KernelHandle m_done;    // auto-reset: an operation has ended
  KernelHandle m_closed;  // manual-reset: the system has let go
  std::atomic<bool> m_isSending = false;
  DWORD m_error = 0;
  DWORD m_count = 0;
  DWORD m_systemComplaints = 0;
  DWORD m_trustError = 0;
};

}  // namespace qxlink
