#include <windows.h>

#include <winhttp.h>

#include "companions/engine/transport.h"
#include "core/format.h"
#include "core/text.h"

namespace engine {
namespace {

constexpr DWORD kConnectTimeout = 5000;  // milliseconds
constexpr DWORD kSendTimeout = 10000;

struct InternetHandleTraits {
  using Type = HINTERNET;
  static bool IsValid(HINTERNET handle) { return handle != nullptr; }
  static void Close(HINTERNET handle) { WinHttpCloseHandle(handle); }
};
using InternetHandle = Scoped<InternetHandleTraits>;

DWORD StatusOf(HINTERNET request) {
  DWORD status = 0;
  DWORD size = sizeof status;
  WinHttpQueryHeaders(request, WINHTTP_QUERY_STATUS_CODE | WINHTTP_QUERY_FLAG_NUMBER, WINHTTP_HEADER_NAME_BY_INDEX,
                      &status, &size, WINHTTP_NO_HEADER_INDEX);
  return status;
}

class WebSocketTransport : public Transport {
 public:
  bool Connect(const DevToolsAddress& address, std::wstring& error) {
    m_session.Reset(WinHttpOpen(nullptr, WINHTTP_ACCESS_TYPE_NO_PROXY, nullptr, nullptr, 0));
    // Answers may take any time once the connection stands.
    WinHttpSetTimeouts(m_session.Get(), kConnectTimeout, kConnectTimeout, kSendTimeout, 0);
    DWORD answerTimeout = kConnectTimeout;
    WinHttpSetOption(m_session.Get(), WINHTTP_OPTION_RECEIVE_RESPONSE_TIMEOUT, &answerTimeout, sizeof answerTimeout);
    m_connection.Reset(WinHttpConnect(m_session.Get(), L"127.0.0.1", address.port, 0));
    InternetHandle request(WinHttpOpenRequest(m_connection.Get(), L"GET", ToWide(address.path).c_str(), nullptr,
                                              WINHTTP_NO_REFERER, WINHTTP_DEFAULT_ACCEPT_TYPES, 0));
    if (!request || !WinHttpSetOption(request.Get(), WINHTTP_OPTION_UPGRADE_TO_WEB_SOCKET, nullptr, 0) ||
        !WinHttpSendRequest(request.Get(), WINHTTP_NO_ADDITIONAL_HEADERS, 0, nullptr, 0, 0, 0) ||
        !WinHttpReceiveResponse(request.Get(), nullptr)) {
      error = Format(L"the browser's port %u does not answer, error %u", address.port, GetLastError());
      return false;
    }
    const DWORD status = StatusOf(request.Get());
    if (status == HTTP_STATUS_SWITCH_PROTOCOLS) m_socket.Reset(WinHttpWebSocketCompleteUpgrade(request.Get(), 0));
    if (!m_socket) {
      error = Format(L"the browser's port refuses a web socket, status %u, error %u", status, GetLastError());
    }
    return static_cast<bool>(m_socket);
  }

  bool Receive(std::string& message, std::wstring& error) override {
    message.clear();
    for (;;) {
      DWORD count = 0;
      WINHTTP_WEB_SOCKET_BUFFER_TYPE type{};
      const DWORD result = WinHttpWebSocketReceive(m_socket.Get(), m_buffer, sizeof m_buffer, &count, &type);
      if (result != NO_ERROR || type == WINHTTP_WEB_SOCKET_CLOSE_BUFFER_TYPE) {
        error = Format(L"the browser's connection has ended, error %u", result);
        return false;
      }
      if (count > sizeof m_buffer || message.size() + count > kLargestMessage) {
        error = L"the browser sends a message that is too large";
        return false;
      }
      message.append(m_buffer, count);
      const bool isWhole =
          type == WINHTTP_WEB_SOCKET_UTF8_MESSAGE_BUFFER_TYPE || type == WINHTTP_WEB_SOCKET_BINARY_MESSAGE_BUFFER_TYPE;
      if (isWhole && !message.empty()) return true;
    }
  }

  bool Send(const std::string& message, std::wstring& error) override {
    // The library takes a pointer that it does not write through.
    const DWORD result = WinHttpWebSocketSend(m_socket.Get(), WINHTTP_WEB_SOCKET_UTF8_MESSAGE_BUFFER_TYPE,
                                              const_cast<char*>(message.data()), static_cast<DWORD>(message.size()));
    if (result != NO_ERROR) error = Format(L"a command cannot be sent to the browser, error %u", result);
    return result == NO_ERROR;
  }

  void Close() noexcept override {
    WinHttpWebSocketShutdown(m_socket.Get(), WINHTTP_WEB_SOCKET_SUCCESS_CLOSE_STATUS, nullptr, 0);
  }

 private:
  InternetHandle m_session;
  InternetHandle m_connection;
  InternetHandle m_socket;
  char m_buffer[size_t{64} << 10] = {};
};

}  // namespace

std::unique_ptr<Transport> ConnectWebSocket(const DevToolsAddress& address, std::wstring& error) {
  auto transport = std::make_unique<WebSocketTransport>();
  if (!transport->Connect(address, error)) return nullptr;
  return transport;
}

}  // namespace engine
