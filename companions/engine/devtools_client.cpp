#include "companions/engine/devtools_client.h"

#include <algorithm>
#include <condition_variable>
#include <deque>
#include <mutex>
#include <thread>
#include <utility>

#include "core/text.h"

namespace engine {
namespace {

constexpr size_t kLongestQueue = size_t{64} << 20;  // bytes of commands that the browser does not take
constexpr int kMostGarbage = 100;                   // messages in a row
constexpr auto kThreadEndTimeout = std::chrono::seconds(3);

}  // namespace

struct DevToolsClient::Channel {
  struct Arrival {
    std::optional<DevToolsMessage> message;
    std::string garbage;  // why it is no message
  };

  std::unique_ptr<Transport> transport;
  std::function<void()> wake;
  mutable std::mutex lock;
  std::condition_variable arrived;
  std::condition_variable toSend;
  std::deque<Arrival> incoming;
  std::deque<std::string> outgoing;
  size_t outgoingBytes = 0;
  bool isWoken = false;  // the owner was told to call Drain, and has not yet
  bool isLost = false;
  std::wstring reason;
  int runningThreads = 2;
  std::condition_variable threadEnded;

  void Lose(const std::wstring& why) {
    {
      const std::lock_guard guard(lock);
      if (isLost) return;
      isLost = true;
      reason = why;
    }
    arrived.notify_all();
    toSend.notify_all();
    wake();
  }

  void ReadAll() {
    std::string bytes;
    std::wstring error;
    int garbageInARow = 0;
    while (garbageInARow < kMostGarbage && transport->Receive(bytes, error)) {
      Arrival arrival;
      arrival.message = ParseDevToolsMessage(bytes, arrival.garbage);
      garbageInARow = arrival.message ? 0 : garbageInARow + 1;
      bool mustWake = false;
      {
        const std::lock_guard guard(lock);
        if (isLost) return;
        mustWake = !std::exchange(isWoken, true);
        incoming.push_back(std::move(arrival));
      }
      arrived.notify_all();
      if (mustWake) wake();
    }
    Lose(garbageInARow == kMostGarbage ? L"the browser speaks no DevTools protocol" : error);
  }

  void WriteAll() {
    std::wstring error;
    for (;;) {
      std::string command;
      {
        std::unique_lock guard(lock);
        toSend.wait(guard, [&] { return isLost || !outgoing.empty(); });
        if (outgoing.empty()) break;
        command = std::move(outgoing.front());
        outgoing.pop_front();
        outgoingBytes -= command.size();
      }
      if (!transport->Send(command, error)) return Lose(error);
    }
    transport->Close();
  }

  void ThreadEnds() {
    {
      const std::lock_guard guard(lock);
      --runningThreads;
    }
    threadEnded.notify_all();
  }
};

DevToolsClient::DevToolsClient(std::unique_ptr<Transport> transport, Listener listener)
    : m_channel(std::make_shared<Channel>()), m_listener(std::move(listener)) {
  m_channel->transport = std::move(transport);
  m_channel->wake = m_listener.wake;
  // Not joined but waited for: a browser that hangs must not hang the window.
  for (const auto work : {&Channel::ReadAll, &Channel::WriteAll}) {
    std::thread([channel = m_channel, work] {
      (channel.get()->*work)();
      channel->ThreadEnds();
    }).detach();
  }
}

DevToolsClient::~DevToolsClient() {
  Close();
  std::unique_lock guard(m_channel->lock);
  m_channel->threadEnded.wait_for(guard, kThreadEndTimeout, [&] { return m_channel->runningThreads == 0; });
}

void DevToolsClient::Close() {
  m_channel->Lose(L"the window is closed");
  const std::lock_guard guard(m_channel->lock);
  m_channel->incoming.clear();
}

uint64_t DevToolsClient::Send(const char* method, const Json::Value& params) {
  const uint64_t id = ++m_lastId;
  std::string command = WriteDevToolsCommand(id, method, params, m_sessionId);
  {
    const std::lock_guard guard(m_channel->lock);
    if (m_channel->isLost) return id;
    m_channel->outgoingBytes += command.size();
    m_channel->outgoing.push_back(std::move(command));
    if (m_channel->outgoingBytes <= kLongestQueue) {
      m_channel->toSend.notify_all();
      return id;
    }
  }
  m_channel->Lose(L"the browser takes no commands");
  return id;
}

void DevToolsClient::SendWatched(const char* method, const Json::Value& params) {
  m_watched[Send(method, params)] = Clock::now();
}

std::optional<DevToolsClient::Clock::time_point> DevToolsClient::SilentSince() const {
  if (m_watched.empty()) return {};
  return m_watched.begin()->second;
}

DevToolsClient::Outcome DevToolsClient::Call(const char* method, const Json::Value& params, Json::Value& result,
                                             Clock::duration timeout) {
  const auto start = Clock::now();
  const uint64_t id = Send(method, params);
  m_awaited[id];
  while (!m_awaited[id] && Drain(std::max(start, m_lastLife) + timeout)) {
  }
  const std::optional<DevToolsMessage> answer = std::move(m_awaited[id]);
  m_awaited.erase(id);
  if (!answer) return IsLost() ? Outcome::kLost : Outcome::kTimedOut;
  result = answer->content;
  if (answer->error.empty()) return Outcome::kDone;
  m_listener.onComplaint(ToWide(std::string(method) + ": " + answer->error));
  return Outcome::kRefused;
}

std::optional<DevToolsMessage> DevToolsClient::Next(std::optional<Clock::time_point> mayWaitUntil) {
  for (;;) {
    Channel::Arrival arrival;
    {
      std::unique_lock guard(m_channel->lock);
      const auto isReady = [&] { return m_channel->isLost || !m_channel->incoming.empty(); };
      if (mayWaitUntil) m_channel->arrived.wait_until(guard, *mayWaitUntil, isReady);
      if (m_channel->incoming.empty()) return {};
      arrival = std::move(m_channel->incoming.front());
      m_channel->incoming.pop_front();
    }
    if (arrival.message) return std::move(arrival.message);
    m_listener.onComplaint(L"the browser sends what is no message: " + ToWide(arrival.garbage));
  }
}

void DevToolsClient::Tell(DevToolsMessage message) {
  if (message.kind == DevToolsMessage::Kind::kEvent) return m_listener.onEvent(message);
  m_watched.erase(message.id);
  const auto awaited = m_awaited.find(message.id);
  if (awaited != m_awaited.end()) {
    awaited->second = std::move(message);
  } else if (!message.error.empty()) {
    m_listener.onComplaint(L"a command was refused: " + ToWide(message.error));
  }
}

bool DevToolsClient::Drain(std::optional<Clock::time_point> mayWaitUntil) {
  if (!mayWaitUntil) {
    const std::lock_guard guard(m_channel->lock);
    m_channel->isWoken = false;
  }
  auto message = Next(mayWaitUntil);
  if (!message) return false;
  Tell(std::move(*message));
  // A caller that waits looks after each message whether its own has come.
  if (mayWaitUntil) return true;
  while ((message = Next({})))
    Tell(std::move(*message));
  return true;
}

bool DevToolsClient::IsLost() const {
  const std::lock_guard guard(m_channel->lock);
  return m_channel->isLost;
}

std::wstring DevToolsClient::LostBecause() const {
  const std::lock_guard guard(m_channel->lock);
  return m_channel->reason;
}

}  // namespace engine
