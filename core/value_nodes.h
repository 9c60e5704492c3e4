// The nodes behind qx::Value, one class for each type. Only value.cpp and value_nodes.cpp see them.
#pragma once

#include <new>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "core/value.h"

namespace qx {

class Value::BaseValue {
 public:
  virtual ~BaseValue() = default;
  virtual Type GetType() const = 0;

  virtual NodePtr Copy() const = 0;
  virtual bool IsTrue() const = 0;
  virtual void AddText(std::wstring& text) const = 0;
  virtual Json::Value ToJson() const = 0;

  BaseValue(const BaseValue&) = delete;
  BaseValue& operator=(const BaseValue&) = delete;
  const MemoryFunctions& Memory() const { return m_memory; }

 protected:
  explicit BaseValue(const MemoryFunctions& memory) : m_memory(memory) {}

 private:
  MemoryFunctions m_memory;  // those with which the node itself was allocated
};

// The one place where nodes come from.
template <class Node, class... Arguments>
Value::NodePtr Value::MakeNode(const MemoryFunctions& memory, Arguments&&... arguments) {
  void* const place = memory.allocate(sizeof(Node));
  if (place == nullptr) throw std::bad_alloc();
  try {
    return NodePtr(new (place) Node(memory, std::forward<Arguments>(arguments)...));
  } catch (...) {
    memory.free(place);
    throw;
  }
}

class Value::NumberValue : public BaseValue {
 public:
  NumberValue(const MemoryFunctions& memory, double value) : BaseValue(memory), number(value) {}
  Type GetType() const override { return kNumber; }
  NodePtr Copy() const override;
  bool IsTrue() const override { return number != 0.0; }
  void AddText(std::wstring& text) const override;
  Json::Value ToJson() const override { return number; }

  double number;
};

class Value::BoolValue : public BaseValue {
 public:
  BoolValue(const MemoryFunctions& memory, bool value) : BaseValue(memory), boolean(value) {}
  Type GetType() const override { return kBool; }
  NodePtr Copy() const override;
  bool IsTrue() const override { return boolean; }
  void AddText(std::wstring& text) const override;
  Json::Value ToJson() const override { return boolean; }

  bool boolean;
};

class Value::StringValue : public BaseValue {
 public:
  StringValue(const MemoryFunctions& memory, std::wstring_view text) : BaseValue(memory), string(text) {}
  Type GetType() const override { return kString; }
  NodePtr Copy() const override;
  bool IsTrue() const override { return !string.empty(); }
  void AddText(std::wstring& text) const override;
  Json::Value ToJson() const override;

  String string;
};

class Value::ArrayValue : public BaseValue {
 public:
  explicit ArrayValue(const MemoryFunctions& memory, std::vector<Value> values = {})
      : BaseValue(memory), elements(std::move(values)) {}
  Type GetType() const override { return kArray; }
  NodePtr Copy() const override;
  bool IsTrue() const override { return !elements.empty(); }
  void AddText(std::wstring& text) const override;
  Json::Value ToJson() const override;

  std::vector<Value> elements;
};

class Value::DictValue : public BaseValue {
 public:
  explicit DictValue(const MemoryFunctions& memory, std::vector<String> names = {}, std::vector<Value> values = {})
      : BaseValue(memory), keys(std::move(names)), members(std::move(values)) {}
  Type GetType() const override { return kObject; }
  NodePtr Copy() const override;
  bool IsTrue() const override { return !members.empty(); }
  void AddText(std::wstring& text) const override;
  Json::Value ToJson() const override;

  Value* Find(std::wstring_view key);  // null when missing
  Value& Set(std::wstring_view key, Value member);

  std::vector<String> keys;
  std::vector<Value> members;  // of the same index
};

}  // namespace qx
