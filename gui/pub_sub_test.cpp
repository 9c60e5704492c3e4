#include "gui/pub_sub.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <thread>

#include "core/logging.h"
#include "gui/tis_comm.h"

namespace {

using qx::PubSub;
using qx::TisComm;
using qx::Value;
using testing::ElementsAre;

}  // namespace

TEST(PubSub, SubscribersAreCalledInOrderAndWriteIntoTheMessage) {
  PubSub bus;
  const auto add = [](int number) { return [number](Value& message) { message.Append(number); }; };
  bus.Subscribe(L"topic", add(1));
  const uint64_t second = bus.Subscribe(L"topic", add(2));
  bus.Subscribe(L"other", add(9));
  bus.Subscribe(L"topic", add(3));
  Value message;
  bus.Publish(L"topic", message);
  bus.Unsubscribe(second);
  bus.Unsubscribe(second);  // and once more
  bus.Unsubscribe(77);
  bus.Publish(L"topic", message);
  bus.Publish(L"nobody", message);
  EXPECT_EQ(message.ToText(), L"[ 1, 2, 3, 1, 3 ]");
}

TEST(PubSub, SubscriberMayUseTheBusWhileItIsCalled) {
  PubSub bus;
  uint64_t own = 0;
  own = bus.Subscribe(L"topic", [&](Value& message) {
    bus.Unsubscribe(own);
    bus.Subscribe(L"inner", [](Value& inner) { inner.Append(L"inner"); });
    bus.Publish(L"inner", message);
  });
  Value message;
  bus.Publish(L"topic", message);
  bus.Publish(L"topic", message);  // nobody any more
  EXPECT_EQ(message.ToText(), L"[ \"inner\" ]");
}

TEST(PubSub, WhatASubscriberThrowsIsLoggedAndEndsOnlyItsOwnCall) {
  logging::ErrorCapture errors;
  PubSub bus;
  bus.Subscribe(L"topic", [](Value& message) { message.AsNumber(); });
  bus.Subscribe(L"topic", [](Value& message) { message.Append(1); });
  Value message;
  bus.Publish(L"topic", message);
  EXPECT_EQ(message.Size(), 1u);
  EXPECT_THAT(errors.Take(),
              ElementsAre(L"qx::PubSub::Publish: [topic] [exception: invalid type [number != null], [null]]"));
}

TEST(PubSub, MayBeUsedByManyThreadsAtOnce) {
  PubSub bus;
  std::atomic<int> calls{0};
  bus.Subscribe(L"topic", [&calls](Value&) { ++calls; });
  std::vector<std::thread> threads;
  threads.reserve(4);
  for (int i = 0; i < 4; ++i) {
    threads.emplace_back([&bus] {
      for (int j = 0; j < 1000; ++j) {
        const uint64_t id = bus.Subscribe(L"topic", [](Value&) {});
        Value message;
        bus.Publish(L"topic", message);
        bus.Unsubscribe(id);
      }
    });
  }
  for (std::thread& thread : threads)
    thread.join();
  EXPECT_EQ(calls, 4000);
}

TEST(TisComm, MessagesHaveTheMembersOfTheProtocol) {
  const auto bus = std::make_shared<PubSub>();
  std::vector<std::wstring> messages;
  bus->Subscribe(L"tis_notif", [&](Value& message) { messages.push_back(message.ToText()); });
  bus->Subscribe(L"tis_call_function", [&](Value& message) {
    messages.push_back(message.ToText());
    message.SetMember(L"response", 42);
  });
  TisComm comm(bus);
  comm.Notify(L"on_error", L"unknown");
  comm.Notify(L"on_finished");
  EXPECT_EQ(comm.Call(L"sum", 7).AsNumber(), 42);
  EXPECT_THAT(messages, ElementsAre(L"{ \"data\" : \"unknown\", \"functionName\" : \"on_error\" }",
                                    L"{ \"data\" : {  }, \"functionName\" : \"on_finished\" }",
                                    L"{ \"args\" : 7, \"functionName\" : \"sum\" }"));
}

TEST(TisComm, SubscriptionsEndWithIt) {
  const auto bus = std::make_shared<PubSub>();
  int calls = 0;
  Value message;
  {
    TisComm comm(bus);
    comm.Subscribe(L"topic", [&calls](Value&) { ++calls; });
    bus->Publish(L"topic", message);
    EXPECT_EQ(comm.Call(L"nobody listens", 1).GetType(), Value::kNull);
  }
  bus->Publish(L"topic", message);
  EXPECT_EQ(calls, 1);
}
