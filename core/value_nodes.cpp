#include "core/value_nodes.h"

#include <algorithm>
#include <locale>
#include <numeric>
#include <sstream>

#include "core/text.h"

namespace qx {
namespace {

void AddQuoted(std::wstring& text, std::wstring_view part) {
  text += L'"';
  text += part;
  text += L'"';
}

}  // namespace

void Value::Release::operator()(BaseValue* node) const {
  const auto free = node->Memory().free;
  void* const place = dynamic_cast<void*>(node);
  node->~BaseValue();
  free(place);
}

Value::NodePtr Value::NumberValue::Copy() const {
  return MakeNode<NumberValue>(Memory(), number);
}
Value::NodePtr Value::BoolValue::Copy() const {
  return MakeNode<BoolValue>(Memory(), boolean);
}
Value::NodePtr Value::StringValue::Copy() const {
  return MakeNode<StringValue>(Memory(), string);
}
Value::NodePtr Value::ArrayValue::Copy() const {
  return MakeNode<ArrayValue>(Memory(), elements);
}
Value::NodePtr Value::DictValue::Copy() const {
  return MakeNode<DictValue>(Memory(), keys, members);
}

void Value::NumberValue::AddText(std::wstring& text) const {
  std::wostringstream stream;
  stream.imbue(std::locale::classic());
  stream << number;
  text += stream.str();
}

void Value::BoolValue::AddText(std::wstring& text) const {
  text += boolean ? L"true" : L"false";
}

void Value::StringValue::AddText(std::wstring& text) const {
  AddQuoted(text, string);
}

void Value::ArrayValue::AddText(std::wstring& text) const {
  const wchar_t* separator = L"";
  text += L"[ ";
  for (const Value& element : elements) {
    text += std::exchange(separator, L", ");
    element.AddText(text);
  }
  text += L" ]";
}

void Value::DictValue::AddText(std::wstring& text) const {
  std::vector<size_t> order(keys.size());
  std::iota(order.begin(), order.end(), size_t{0});
  std::sort(order.begin(), order.end(), [this](size_t a, size_t b) { return keys[a] < keys[b]; });
  const wchar_t* separator = L"";
  text += L"{ ";
  for (const size_t index : order) {
    text += std::exchange(separator, L", ");
    AddQuoted(text, keys[index]);
    text += L" : ";
    members[index].AddText(text);
  }
  text += L" }";
}

Json::Value Value::StringValue::ToJson() const {
  return ToUtf8(string);
}

Json::Value Value::ArrayValue::ToJson() const {
  Json::Value json(Json::arrayValue);
  for (const Value& element : elements)
    json.append(element.ToJson());
  return json;
}

Json::Value Value::DictValue::ToJson() const {
  Json::Value json(Json::objectValue);
  for (size_t i = 0; i < keys.size(); ++i)
    json[ToUtf8(keys[i])] = members[i].ToJson();
  return json;
}

Value* Value::DictValue::Find(std::wstring_view key) {
  const auto found = std::find(keys.begin(), keys.end(), key);
  return found == keys.end() ? nullptr : &members[static_cast<size_t>(found - keys.begin())];
}

Value& Value::DictValue::Set(std::wstring_view key, Value member) {
  if (Value* const older = Find(key)) return *older = std::move(member);
  String name(key);
  members.emplace_back();  // both lists grow or neither
  try {
    keys.push_back(std::move(name));
  } catch (...) {
    members.pop_back();
    throw;
  }
  return members.back() = std::move(member);
}

}  // namespace qx
