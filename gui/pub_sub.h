// The bus on which the page, the window and the handlers talk: messages by topic, delivered at once on the thread that
// publishes. One for the process.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "core/lock.h"
#include "core/value.h"

namespace qx {

// Any thread may call. A subscriber may publish, subscribe and unsubscribe in turn, and may still be called by a
// publish that began before it was unsubscribed: whoever unsubscribes sees to it that none is under way.
class PubSub {
 public:
  using Callback = std::function<void(Value& message)>;

  // Calls the topic's subscribers in the order in which they subscribed; what they write into the message is how an
  // answer comes back. What one throws is logged and ends only its own call.
  void Publish(std::wstring_view topic, Value& message) const;

  // The id is never 0 and never used again.
  uint64_t Subscribe(std::wstring_view topic, Callback callback);
  void Unsubscribe(uint64_t id);

 private:
  struct Subscriber {
    uint64_t id;
    Callback callback;
  };
  using Subscribers = std::vector<std::shared_ptr<const Subscriber>>;

  Subscribers SubscribersOf(std::wstring_view topic) const;

  mutable SharedLock m_lock;
  std::map<std::wstring, Subscribers, std::less<>> m_topics;
  uint64_t m_lastId = 0;
};

}  // namespace qx
