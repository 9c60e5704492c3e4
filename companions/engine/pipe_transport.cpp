#include <utility>

#include "companions/engine/transport.h"
#include "core/format.h"

namespace engine {
namespace {

// Messages end with a zero byte, in both directions.
class PipeTransport : public Transport {
 public:
  PipeTransport(KernelHandle fromBrowser, KernelHandle toBrowser)
      : m_fromBrowser(std::move(fromBrowser)), m_toBrowser(std::move(toBrowser)) {}

  bool Receive(std::string& message, std::wstring& error) override {
    for (;;) {
      if (auto next = m_splitter.Next()) {
        if (next->empty()) continue;
        message = std::move(*next);
        return true;
      }
      DWORD count = 0;
      if (!ReadFile(m_fromBrowser.Get(), m_buffer, sizeof m_buffer, &count, nullptr) || count == 0) {
        error = Format(L"the browser's pipe has ended, error %u", GetLastError());
        return false;
      }
      if (!m_splitter.Add({m_buffer, count})) {
        error = L"the browser sends a message that is too large";
        return false;
      }
    }
  }

  bool Send(const std::string& message, std::wstring& error) override {
    const std::string framed = message + '\0';
    for (size_t sent = 0; sent < framed.size();) {
      DWORD count = 0;
      if (!WriteFile(m_toBrowser.Get(), framed.data() + sent, static_cast<DWORD>(framed.size() - sent), &count,
                     nullptr)) {
        error = Format(L"a command cannot be sent to the browser, error %u", GetLastError());
        return false;
      }
      sent += count;
    }
    return true;
  }

  // Reading may go on; the browser ends when nobody writes to it any more.
  void Close() noexcept override { m_toBrowser.Reset(); }

 private:
  KernelHandle m_fromBrowser;
  KernelHandle m_toBrowser;
  MessageSplitter m_splitter;
  char m_buffer[size_t{64} << 10] = {};
};

}  // namespace

std::unique_ptr<Transport> MakePipeTransport(KernelHandle fromBrowser, KernelHandle toBrowser) {
  return std::make_unique<PipeTransport>(std::move(fromBrowser), std::move(toBrowser));
}

}  // namespace engine
