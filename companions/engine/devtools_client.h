// One DevTools connection. Commands are sent and messages arrive on threads of the client's own; everything it tells
// its owner, it tells on the owner's thread: while the owner waits for an answer, or asks to be told.
#pragma once

#include <windows.h>

#include <chrono>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>

#include "companions/engine/devtools_message.h"
#include "companions/engine/transport.h"

namespace engine {

class DevToolsClient {
 public:
  using Clock = std::chrono::steady_clock;

  struct Listener {
    std::function<void(const DevToolsMessage&)> onEvent;
    std::function<void(const std::wstring&)> onComplaint;  // garbage came, a command was refused
    std::function<void()> wake;                            // on another thread: messages are there, call Drain
  };

  enum class Outcome { kDone, kRefused, kTimedOut, kLost };

  DevToolsClient(std::unique_ptr<Transport> transport, Listener listener);
  ~DevToolsClient();  // closes the connection; the browser should have been ended before
  DevToolsClient(const DevToolsClient&) = delete;
  DevToolsClient& operator=(const DevToolsClient&) = delete;

  void UseSession(std::string sessionId) { m_sessionId = std::move(sessionId); }

  // Sends a command whose answer is not waited for. Never blocks.
  uint64_t Send(const char* method, const Json::Value& params = {});

  // The same; SilentSince tells for how long its answer is missing.
  void SendWatched(const char* method, const Json::Value& params);
  std::optional<Clock::time_point> SilentSince() const;  // the oldest such command's time

  // Sends a command and waits for its answer. Events that come meanwhile are told, which may lead to nested calls.
  Outcome Call(const char* method, const Json::Value& params, Json::Value& result, Clock::duration timeout);

  // The page does something that shows that it does not hang: the waiting times begin anew.
  void NoteLife() { m_lastLife = Clock::now(); }
  Clock::time_point LastLife() const { return m_lastLife; }

  // Tells what has come. `mayWaitUntil`: until then it waits for at least one message. False when none came.
  bool Drain(std::optional<Clock::time_point> mayWaitUntil = {});

  bool IsLost() const;
  std::wstring LostBecause() const;
  void Close();  // from now on it is lost; nothing is told any more

 private:
  struct Channel;  // what the threads share; it outlives the client when a thread hangs

  std::optional<DevToolsMessage> Next(std::optional<Clock::time_point> mayWaitUntil);
  void Tell(DevToolsMessage message);

  const std::shared_ptr<Channel> m_channel;
  Listener m_listener;
  std::string m_sessionId;
  uint64_t m_lastId = 0;
  Clock::time_point m_lastLife;
  std::map<uint64_t, std::optional<DevToolsMessage>> m_awaited;
  std::map<uint64_t, Clock::time_point> m_watched;
};

}  // namespace engine
