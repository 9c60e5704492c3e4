// The two ways to a browser's DevTools connection. A pair of pipes, which only this process and the browser hold, is
// taken where the browser can inherit them; a web socket on the loopback interface otherwise.
#pragma once

#include <windows.h>

#include <memory>
#include <string>

#include "companions/engine/devtools_message.h"
#include "core/scoped.h"

namespace engine {

class Transport {
 public:
  virtual ~Transport() = default;

  // One whole message, not empty. False, and `error` says why, when there will be none any more. Blocks; called by one
  // thread, as Send is by another.
  virtual bool Receive(std::string& message, std::wstring& error) = 0;
  virtual bool Send(const std::string& message, std::wstring& error) = 0;

  // Says good-bye, on the thread that sends, as its last. What blocks in Receive may need the end of the browser to
  // come back.
  virtual void Close() noexcept = 0;
};

// Null, and `error` says why, when the connection is not accepted within some 5 seconds.
std::unique_ptr<Transport> ConnectWebSocket(const DevToolsAddress& address, std::wstring& error);

// The ends of this process: what the browser writes, and what it reads.
std::unique_ptr<Transport> MakePipeTransport(KernelHandle fromBrowser, KernelHandle toBrowser);

}  // namespace engine
