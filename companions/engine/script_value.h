// A value of the page's script, as native code holds it: plain data by value, and functions of the page by reference.
// Copies share arrays and maps until one of them is changed. No value can contain itself. Includes no Windows header.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <variant>
#include <vector>

namespace engine {

class ScriptValue;

// Where functions of a page live.
class FunctionHome {
 public:
  virtual ~FunctionHome() = default;

  // Runs the function in the page. False, with an error value in `result`, when it cannot be run or throws. Only on
  // the thread of its window.
  virtual bool CallFunction(uint64_t id, const std::vector<ScriptValue>& arguments, ScriptValue& result) = 0;

  // Called from whatever thread lets the last reference go.
  virtual void ReleaseFunction(uint64_t id) noexcept = 0;
};

// A function of a page's script. The page keeps it until the last reference here goes.
class ScriptFunction {
 public:
  ScriptFunction(std::weak_ptr<FunctionHome> home, uint64_t id) : m_home(std::move(home)), m_id(id) {}
  ~ScriptFunction() {
    if (const auto home = m_home.lock()) home->ReleaseFunction(m_id);
  }
  ScriptFunction(const ScriptFunction&) = delete;
  ScriptFunction& operator=(const ScriptFunction&) = delete;

  std::shared_ptr<FunctionHome> Home() const { return m_home.lock(); }  // null: its page is gone
  uint64_t Id() const { return m_id; }

 private:
  const std::weak_ptr<FunctionHome> m_home;
  const uint64_t m_id;
};

struct Undefined {};
struct Null {};
struct Text {
  std::wstring text;
  bool isError = false;
};
struct Date {
  double milliseconds = 0;  // since 1970-01-01 UTC
};
struct Bytes {
  std::string bytes;
};

class ScriptValue {
 public:
  using Array = std::vector<ScriptValue>;
  using Map = std::vector<std::pair<ScriptValue, ScriptValue>>;  // in the order of insertion
  using Function = std::shared_ptr<const ScriptFunction>;
  using Data = std::variant<Undefined, Null, bool, int32_t, double, Text, Date, Bytes, std::shared_ptr<Array>,
                            std::shared_ptr<Map>, Function>;

  // Not inline: compilers then see through the variant, and take its unused members for uninitialised ones.
  ScriptValue();
  ScriptValue(const ScriptValue& other);
  ScriptValue(ScriptValue&& other) noexcept;
  ScriptValue& operator=(const ScriptValue& other);
  ScriptValue& operator=(ScriptValue&& other) noexcept;
  ~ScriptValue();
  template <class T, class = std::enable_if_t<std::is_constructible_v<Data, std::in_place_type_t<T>, T>>>
  explicit ScriptValue(T data) : m_data(std::move(data)) {}
  static ScriptValue Of(Array array) { return ScriptValue(std::make_shared<Array>(std::move(array))); }
  static ScriptValue Of(Map map) { return ScriptValue(std::make_shared<Map>(std::move(map))); }
  static ScriptValue Error(std::wstring text) { return ScriptValue(Text{std::move(text), true}); }

  const Data& Get() const { return m_data; }
  template <class T>
  const T* As() const {
    return std::get_if<T>(&m_data);
  }
  const Array* AsArray() const;
  const Map* AsMap() const;

  // For changing: makes this value an array or map when it is none, and its own when it is shared.
  Array& EditArray();
  Map& EditMap();

  const ScriptValue* Find(const ScriptValue& key) const;  // in a map; null when it is not there or this is no map
  void Set(const ScriptValue& key, ScriptValue value);    // makes this a map when it is none

 private:
  Data m_data;
};

// For keys of maps: same type, same content. Arrays, maps and functions are equal only to themselves.
bool SameKey(const ScriptValue& one, const ScriptValue& other);

}  // namespace engine
