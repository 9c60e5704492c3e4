#include "gui/pub_sub.h"

#include <algorithm>
#include <exception>
#include <mutex>
#include <shared_mutex>
#include <utility>

#include "core/logging.h"

namespace qx {

void PubSub::Publish(std::wstring_view topic, Value& message) const {
  constexpr wchar_t kScope[] = L"qx::PubSub::Publish";
  for (const auto& subscriber : SubscribersOf(topic)) {
    try {
      subscriber->callback(message);
    } catch (const std::exception& exception) {
      LOG_ERROR(kScope, L"[%s] [%S]", std::wstring(topic).c_str(), exception.what());
    }
  }
}

uint64_t PubSub::Subscribe(std::wstring_view topic, Callback callback) {
  const std::lock_guard lock(m_lock);
  const uint64_t id = ++m_lastId;
  m_topics[std::wstring(topic)].push_back(std::make_shared<const Subscriber>(Subscriber{id, std::move(callback)}));
  return id;
}

void PubSub::Unsubscribe(uint64_t id) {
  const std::lock_guard lock(m_lock);
  for (auto topic = m_topics.begin(); topic != m_topics.end(); ++topic) {
    Subscribers& subscribers = topic->second;
    const auto found = std::find_if(subscribers.begin(), subscribers.end(),
                                    [id](const auto& subscriber) { return subscriber->id == id; });
    if (found == subscribers.end()) continue;
    subscribers.erase(found);
    if (subscribers.empty()) m_topics.erase(topic);
    return;
  }
}

PubSub::Subscribers PubSub::SubscribersOf(std::wstring_view topic) const {
  const std::shared_lock lock(m_lock);
  const auto found = m_topics.find(topic);
  return found == m_topics.end() ? Subscribers() : found->second;
}

}  // namespace qx
