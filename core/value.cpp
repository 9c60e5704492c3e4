#include "core/value.h"

#include <algorithm>
#include <cstdlib>
#include <iterator>
#include <locale>
#include <new>
#include <numeric>
#include <sstream>
#include <utility>

#include "core/format.h"
#include "core/json.h"
#include "core/text.h"

namespace qx {

class Value::BaseValue {
 public:
  virtual ~BaseValue() = default;
  virtual Type GetType() const = 0;

  BaseValue(const BaseValue&) = delete;
  BaseValue& operator=(const BaseValue&) = delete;
  const MemoryFunctions& Memory() const { return m_memory; }

 protected:
  explicit BaseValue(const MemoryFunctions& memory) : m_memory(memory) {}

 private:
  MemoryFunctions m_memory;  // those with which the node itself was allocated
};

class Value::NumberValue : public BaseValue {
 public:
  NumberValue(const MemoryFunctions& memory, double value) : BaseValue(memory), number(value) {}
  Type GetType() const override { return kNumber; }
  double number;
};

class Value::BoolValue : public BaseValue {
 public:
  BoolValue(const MemoryFunctions& memory, bool value) : BaseValue(memory), boolean(value) {}
  Type GetType() const override { return kBool; }
  bool boolean;
};

class Value::StringValue : public BaseValue {
 public:
  StringValue(const MemoryFunctions& memory, std::wstring_view text) : BaseValue(memory), string(text) {}
  Type GetType() const override { return kString; }
  String string;
};

class Value::ArrayValue : public BaseValue {
 public:
  explicit ArrayValue(const MemoryFunctions& memory, std::vector<Value> values = {})
      : BaseValue(memory), elements(std::move(values)) {}
  Type GetType() const override { return kArray; }
  std::vector<Value> elements;
};

class Value::DictValue : public BaseValue {
 public:
  explicit DictValue(const MemoryFunctions& memory, std::vector<String> names = {}, std::vector<Value> values = {})
      : BaseValue(memory), keys(std::move(names)), members(std::move(values)) {}
  Type GetType() const override { return kObject; }

  Value* Find(std::wstring_view key) {
    const auto found = std::find(keys.begin(), keys.end(), key);
    return found == keys.end() ? nullptr : &members[static_cast<size_t>(found - keys.begin())];
  }

  std::vector<String> keys;
  std::vector<Value> members;  // of the same index
};

const MemoryFunctions& RuntimeMemory() {
  static const MemoryFunctions s_functions{&std::malloc, &std::realloc, &std::free};
  return s_functions;
}

ValueException::ValueException(std::wstring_view message) : m_message(ToUtf8(message)) {}

// Nodes

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

void Value::Release::operator()(BaseValue* node) const {
  const MemoryFunctions memory = node->Memory();
  void* const place = dynamic_cast<void*>(node);
  node->~BaseValue();
  memory.free(place);
}

Value::NodePtr Value::CopyNode(const BaseValue* node) {
  if (node == nullptr) return {};
  switch (node->GetType()) {
    case kNumber:
      return MakeNode<NumberValue>(node->Memory(), static_cast<const NumberValue*>(node)->number);
    case kBool:
      return MakeNode<BoolValue>(node->Memory(), static_cast<const BoolValue*>(node)->boolean);
    case kString:
      return MakeNode<StringValue>(node->Memory(), static_cast<const StringValue*>(node)->string);
    case kArray:
      return MakeNode<ArrayValue>(node->Memory(), static_cast<const ArrayValue*>(node)->elements);
    case kObject: {
      const auto* const dict = static_cast<const DictValue*>(node);
      return MakeNode<DictValue>(node->Memory(), dict->keys, dict->members);
    }
    case kNull:
      break;
  }
  return {};
}

void Value::SetNumber(double value, const MemoryFunctions& memory) {
  m_node = MakeNode<NumberValue>(memory, value);
}

void Value::SetBool(bool value, const MemoryFunctions& memory) {
  m_node = MakeNode<BoolValue>(memory, value);
}

void Value::SetString(std::wstring_view text, const MemoryFunctions& memory) {
  m_node = MakeNode<StringValue>(memory, text);
}

Value Value::EmptyArray(const MemoryFunctions& memory) {
  Value value;
  value.m_node = MakeNode<ArrayValue>(memory);
  return value;
}

Value Value::EmptyObject(const MemoryFunctions& memory) {
  Value value;
  value.m_node = MakeNode<DictValue>(memory);
  return value;
}

Value::Value(const Value& other) : m_node(CopyNode(other.m_node.get())) {}

Value& Value::operator=(const Value& other) {
  m_node = CopyNode(other.m_node.get());  // first the copy: `other` may be a part of this value
  return *this;
}

// Types

Value::Type Value::GetType() const {
  return m_node ? m_node->GetType() : kNull;
}

const wchar_t* Value::TypeName(uint32_t type) {
  static constexpr const wchar_t* kNames[] = {L"null", L"number", L"bool", L"string", L"array", L"object"};
  return type < std::size(kNames) ? kNames[type] : L"unknown";
}

void Value::ThrowWrongType(const wchar_t* format) const {
  throw ValueException(Format(format, TypeName(), ToText().c_str()));
}

template <class Node>
Node& Value::Expect(Type type, const wchar_t* format) const {
  if (GetType() != type) ThrowWrongType(format);
  return static_cast<Node&>(*m_node);
}

Value::DictValue& Value::ExpectDict(std::wstring_view key) const {
  if (GetType() != kObject) {
    throw ValueException(Format(L"exception: invalid type [dict != %s] for [key %s], [%s]", TypeName(),
                                String(key).c_str(), ToText().c_str()));
  }
  return static_cast<DictValue&>(*m_node);
}

// Reads

double Value::AsNumber() const {
  return Expect<NumberValue>(kNumber, L"exception: invalid type [number != %s], [%s]").number;
}

const String& Value::AsString() const {
  return Expect<StringValue>(kString, L"exception: invalid type [string != %s], [%s]").string;
}

bool Value::IsTrue() const {
  switch (GetType()) {
    case kNumber:
      return AsNumber() != 0.0;
    case kBool:
      return static_cast<const BoolValue&>(*m_node).boolean;
    case kString:
      return !AsString().empty();
    case kArray:
    case kObject:
      return Size() != 0;
    case kNull:
      break;
  }
  return false;
}

size_t Value::Size() const {
  if (GetType() == kObject) return static_cast<const DictValue&>(*m_node).members.size();
  // No blank behind "type": existing readers of the message know it so.
  return Expect<ArrayValue>(kArray, L"exception: invalid type[array|dict != %s], [%s]").elements.size();
}

const Value& Value::Element(size_t index) const {
  return Expect<ArrayValue>(kArray, L"exception: invalid type [array != %s], [%s]").elements[index];
}

Value& Value::Element(size_t index) {
  return const_cast<Value&>(std::as_const(*this).Element(index));
}

const Value& Value::Member(std::wstring_view key) const {
  if (const Value* const member = ExpectDict(key).Find(key)) return *member;
  throw ValueException(Format(L"exception: key not found [%s], [%s]", String(key).c_str(), ToText().c_str()));
}

Value& Value::Member(std::wstring_view key) {
  return const_cast<Value&>(std::as_const(*this).Member(key));
}

bool Value::HasMember(std::wstring_view key) const {
  return Expect<DictValue>(kObject, L"exception: invalid type [dict != %s], [%s]").Find(key) != nullptr;
}

const std::vector<String>& Value::Keys() const {
  return Expect<DictValue>(kObject, L"exception: invalid type [dict != %s], [%s]").keys;
}

// Changes

Value& Value::Append(Value element) {
  if (!m_node) *this = EmptyArray();
  auto& elements = Expect<ArrayValue>(kArray, L"exception: invalid type [array != %s], [%s]").elements;
  return elements.emplace_back(std::move(element));
}

Value& Value::SetMember(std::wstring_view key, Value member) {
  if (!m_node) *this = EmptyObject();
  DictValue& dict = ExpectDict(key);
  if (Value* const older = dict.Find(key)) return *older = std::move(member);
  dict.members.reserve(dict.members.size() + 1);  // so that both lists grow or neither
  dict.keys.emplace_back(key);
  return dict.members.emplace_back(std::move(member));
}

// Text and JSON

namespace {

std::wstring NumberText(double number) {
  std::wostringstream stream;
  stream.imbue(std::locale::classic());
  stream << number;
  return stream.str();
}

}  // namespace

std::wstring Value::ToText() const {
  std::wstring text;
  AddText(text);
  return text;
}

void Value::AddText(std::wstring& text) const {
  const auto addQuoted = [&text](std::wstring_view part) { text.append(L"\"").append(part).append(L"\""); };
  const wchar_t* separator = L"";
  switch (GetType()) {
    case kNull:
      text += L"null";
      break;
    case kNumber:
      text += NumberText(AsNumber());
      break;
    case kBool:
      text += IsTrue() ? L"true" : L"false";
      break;
    case kString:
      addQuoted(AsString());
      break;
    case kArray:
      text += L"[ ";
      for (const Value& element : static_cast<const ArrayValue&>(*m_node).elements) {
        text += std::exchange(separator, L", ");
        element.AddText(text);
      }
      text += L" ]";
      break;
    case kObject: {
      const auto& dict = static_cast<const DictValue&>(*m_node);
      std::vector<size_t> order(dict.keys.size());
      std::iota(order.begin(), order.end(), size_t{0});
      std::sort(order.begin(), order.end(), [&](size_t a, size_t b) { return dict.keys[a] < dict.keys[b]; });
      text += L"{ ";
      for (const size_t index : order) {
        text += std::exchange(separator, L", ");
        addQuoted(dict.keys[index]);
        text += L" : ";
        dict.members[index].AddText(text);
      }
      text += L" }";
      break;
    }
  }
}

Json::Value Value::ToJson() const {
  switch (GetType()) {
    case kNumber:
      return Json::Value(AsNumber());
    case kBool:
      return Json::Value(IsTrue());
    case kString:
      return Json::Value(ToUtf8(AsString()));
    case kArray: {
      Json::Value json(Json::arrayValue);
      for (const Value& element : static_cast<const ArrayValue&>(*m_node).elements)
        json.append(element.ToJson());
      return json;
    }
    case kObject: {
      const auto& dict = static_cast<const DictValue&>(*m_node);
      Json::Value json(Json::objectValue);
      for (size_t i = 0; i < dict.keys.size(); ++i)
        json[ToUtf8(dict.keys[i])] = dict.members[i].ToJson();
      return json;
    }
    case kNull:
      break;
  }
  return {};
}

Value Value::FromJson(const Json::Value& json) {
  switch (json.type()) {
    case Json::intValue:
    case Json::uintValue:
    case Json::realValue:
      return Value(json.asDouble());
    case Json::booleanValue:
      return Value(json.asBool());
    case Json::stringValue:
      return Value(ToWide(json.asString()));
    case Json::arrayValue: {
      Value value = EmptyArray();
      for (const Json::Value& element : json)
        value.Append(FromJson(element));
      return value;
    }
    case Json::objectValue: {
      Value value = EmptyObject();
      for (auto member = json.begin(); member != json.end(); ++member) {
        value.SetMember(ToWide(member.name()), FromJson(*member));
      }
      return value;
    }
    case Json::nullValue:
      break;
  }
  return {};
}

std::string Value::ToJsonText() const {
  return WriteCompactJson(ToJson());
}

}  // namespace qx
