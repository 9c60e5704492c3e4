#include "gui/tis_comm.h"

#include <utility>

namespace qx {

TisComm::TisComm(std::shared_ptr<PubSub> bus) : m_bus(std::move(bus)) {}

TisComm::~TisComm() {
  for (const uint64_t id : m_subscriptions)
    m_bus->Unsubscribe(id);
}

uint64_t TisComm::Subscribe(std::wstring_view topic, PubSub::Callback callback) {
  const uint64_t id = m_bus->Subscribe(topic, std::move(callback));
  m_subscriptions.push_back(id);
  return id;
}

void TisComm::Notify(std::wstring_view functionName, const Value& data) {
  Value message;
  message.SetMember(kFunctionName, functionName);
  message.SetMember(kData, data);
  m_bus->Publish(kNotifyTopic, message);
}

void TisComm::Notify(std::wstring_view functionName) {
  Notify(functionName, Value::EmptyObject());
}

Value TisComm::Call(std::wstring_view functionName, const Value& arguments) {
  Value message;
  message.SetMember(kFunctionName, functionName);
  message.SetMember(kArguments, arguments);
  m_bus->Publish(kCallFunctionTopic, message);
  return message.HasMember(kResponse) ? message.Member(kResponse) : Value();
}

}  // namespace qx
