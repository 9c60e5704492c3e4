#include "core/value.h"

#include <cstdlib>
#include <iterator>
#include <utility>

#include "core/format.h"
#include "core/json.h"
#include "core/text.h"
#include "core/value_nodes.h"

namespace qx {

const MemoryFunctions& RuntimeMemory() {
  static const MemoryFunctions s_functions{&std::malloc, &std::realloc, &std::free};
  return s_functions;
}

ValueException::ValueException(std::wstring_view message) : m_message(ToUtf8(message)) {}

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

Value::Value(const Value& other) : m_node(other.m_node ? other.m_node->Copy() : nullptr) {}

Value& Value::operator=(const Value& other) {
  *this = Value(other);  // first the copy: `other` may be a part of this value
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
  return m_node && m_node->IsTrue();
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
  return ExpectDict(key).Set(key, std::move(member));
}

// Text and JSON

std::wstring Value::ToText() const {
  std::wstring text;
  AddText(text);
  return text;
}

void Value::AddText(std::wstring& text) const {
  if (m_node) {
    m_node->AddText(text);
  } else {
    text += L"null";
  }
}

Json::Value Value::ToJson() const {
  return m_node ? m_node->ToJson() : Json::Value();
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
