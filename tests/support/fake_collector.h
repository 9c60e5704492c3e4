// Collectors whose Start is a function of the test.
#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <string>
#include <utility>

#include "systeminfo/data_collector.h"

class FakeCollector : public systeminfo::ICollector {
 public:
  using Body = std::function<void(Json::Value& data, WMIWrapper& wmi, const std::atomic<bool>& cancel)>;
  FakeCollector(std::wstring name, Body body) : ICollector(std::move(name)), m_body(std::move(body)) {}

  void Start(const std::shared_ptr<systeminfo::CollectingSettings>& settings, const std::shared_ptr<WMIWrapper>& wmi,
             const std::atomic<bool>* cancel) override {
    EXPECT_NE(settings, nullptr);
    m_body(m_data, *wmi, *cancel);
  }

 private:
  Body m_body;
};

inline systeminfo::PlannedCollector FakeWithCancel(std::wstring name, FakeCollector::Body body) {
  return {std::make_shared<FakeCollector>(std::move(name), std::move(body)), L"Fake"};
}

inline systeminfo::PlannedCollector Fake(std::wstring name, std::function<Json::Value(WMIWrapper& wmi)> body) {
  return FakeWithCancel(std::move(name), [body = std::move(body)](Json::Value& data, WMIWrapper& wmi,
                                                                  const std::atomic<bool>&) { data = body(wmi); });
}

inline systeminfo::PlannedCollector Fake(std::wstring name, Json::Value data) {
  return Fake(std::move(name), [data = std::move(data)](WMIWrapper&) { return data; });
}
