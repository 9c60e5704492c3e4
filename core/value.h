// The program's dynamically typed value: null, number, bool, string, array or object, nested freely. Messages between
// the page and the program and small documents are built of it; it becomes JSON text through the JSON library.
#pragma once

#include <json/value.h>

#include <cstddef>
#include <cstdint>
#include <exception>
#include <memory>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

#include "core/string.h"

namespace qx {

// How a node gets and gives back its memory. `allocate` returns null when there is none. Nodes never change their size;
// `reallocate` belongs to the set because whoever replaces one function replaces all three.
struct MemoryFunctions {
  void* (*allocate)(size_t bytes);
  void* (*reallocate)(void* memory, size_t bytes);
  void (*free)(void* memory);
};

const MemoryFunctions& RuntimeMemory();  // the C runtime's

// A value was asked for what it is not. The text is UTF-8.
class ValueException : public std::exception {
 public:
  explicit ValueException(std::wstring_view message);
  const char* what() const noexcept override { return m_message.c_str(); }

 private:
  std::string m_message;
};

// A handle that owns at most one node; copies are deep. Asking for the wrong type throws ValueException and nothing
// else happens. Destruction, copies and conversions recurse: they are made for trees of up to 1,000 levels, which is
// also what ParseJson lets in. Instances may be read by several threads, like a std::vector.
class Value {
 public:
  enum Type : uint32_t { kNull, kNumber, kBool, kString, kArray, kObject };

  class BaseValue;
  class NumberValue;
  class BoolValue;
  class StringValue;
  class ArrayValue;
  class DictValue;

  Value() noexcept = default;  // null
  template <class T>
  requires std::is_arithmetic_v<T> Value(T value, const MemoryFunctions& memory = RuntimeMemory()) {
    if constexpr (std::is_same_v<T, bool>) {
      SetBool(value, memory);
    } else {
      SetNumber(static_cast<double>(value), memory);
    }
  }
  template <class T>
  requires std::is_convertible_v<const T&, std::wstring_view> Value(const T& text,
                                                                    const MemoryFunctions& memory = RuntimeMemory()) {
    SetString(text, memory);
  }
  static Value EmptyArray(const MemoryFunctions& memory = RuntimeMemory());
  static Value EmptyObject(const MemoryFunctions& memory = RuntimeMemory());

  // A copy's nodes come from the memory functions of the original's.
  Value(const Value& other);
  Value(Value&& other) noexcept = default;
  Value& operator=(const Value& other);
  Value& operator=(Value&& other) noexcept = default;
  ~Value() = default;

  Type GetType() const;
  const wchar_t* TypeName() const { return TypeName(GetType()); }
  static const wchar_t* TypeName(uint32_t type);  // "unknown" for a number that is no type

  double AsNumber() const;
  const String& AsString() const;
  bool IsTrue() const;  // never throws: null and whatever is zero, false or empty are false
  size_t Size() const;  // of an array or object

  // The index is not checked against the size. References stay good until the array or object next grows.
  const Value& Element(size_t index) const;
  Value& Element(size_t index);
  const Value& Member(std::wstring_view key) const;  // keys are case-sensitive; throws when missing
  Value& Member(std::wstring_view key);
  bool HasMember(std::wstring_view key) const;
  const std::vector<String>& Keys() const;  // in the order in which they were first set

  // A null value becomes an empty array or object first. Return what was put in.
  Value& Append(Value element);
  Value& SetMember(std::wstring_view key, Value member);  // replaces an older one in its place

  // For messages and logs, not JSON: nothing is escaped, numbers have six digits, members stand sorted by key.
  std::wstring ToText() const;

  // Every JSON number becomes a double, and a double comes back. FromJson sees the keys in the JSON library's order.
  Json::Value ToJson() const;
  static Value FromJson(const Json::Value& json);
  std::string ToJsonText() const;  // UTF-8, one line, ended by a newline

 private:
  struct Release {
    void operator()(BaseValue* node) const;
  };
  using NodePtr = std::unique_ptr<BaseValue, Release>;

  template <class Node, class... Arguments>
  static NodePtr MakeNode(const MemoryFunctions& memory, Arguments&&... arguments);

  void SetNumber(double value, const MemoryFunctions& memory);
  void SetBool(bool value, const MemoryFunctions& memory);
  void SetString(std::wstring_view text, const MemoryFunctions& memory);

  // The node, or the exception with `format`'s message.
  template <class Node>
  Node& Expect(Type type, const wchar_t* format) const;
  DictValue& ExpectDict(std::wstring_view key) const;
  [[noreturn]] void ThrowWrongType(const wchar_t* format) const;
  void AddText(std::wstring& text) const;

  NodePtr m_node;
};

}  // namespace qx
