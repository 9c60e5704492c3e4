// How native code talks to the page: it tells it something, or calls one of its functions and reads the answer. The
// window, which alone knows the page, listens on the bus.
#pragma once

#include <cstdint>
#include <memory>
#include <string_view>
#include <vector>

#include "gui/pub_sub.h"

namespace qx {

inline constexpr wchar_t kNotifyTopic[] = L"tis_notif";
inline constexpr wchar_t kCallFunctionTopic[] = L"tis_call_function";

// The members of the messages.
inline constexpr wchar_t kFunctionName[] = L"functionName";
inline constexpr wchar_t kData[] = L"data";
inline constexpr wchar_t kArguments[] = L"args";
inline constexpr wchar_t kRequest[] = L"request";
inline constexpr wchar_t kResponse[] = L"response";

// The order of the operations is fixed: other components call them by their place.
class ITisComm {
 public:
  virtual uint64_t Subscribe(std::wstring_view topic, PubSub::Callback callback) = 0;
  virtual void Notify(std::wstring_view functionName, const Value& data) = 0;
  virtual void Notify(std::wstring_view functionName) = 0;
  virtual Value Call(std::wstring_view functionName, const Value& arguments) = 0;
  virtual ~ITisComm() = default;
};

// Any thread may notify and call; calling waits for the page's answer, which is null when there is none. Subscribing,
// and destruction, which ends the subscriptions made here, are for one thread.
class TisComm : public ITisComm {
 public:
  explicit TisComm(std::shared_ptr<PubSub> bus);
  ~TisComm() override;
  TisComm(const TisComm&) = delete;
  TisComm& operator=(const TisComm&) = delete;

  uint64_t Subscribe(std::wstring_view topic, PubSub::Callback callback) override;
  void Notify(std::wstring_view functionName, const Value& data) override;
  void Notify(std::wstring_view functionName) override;
  Value Call(std::wstring_view functionName, const Value& arguments) override;

 private:
  const std::shared_ptr<PubSub> m_bus;
  std::vector<uint64_t> m_subscriptions;
};

}  // namespace qx
