#include "companions/engine/script_value.h"

#include <algorithm>

namespace engine {
namespace {

template <class Container>
Container& Edit(ScriptValue::Data& data) {
  auto* held = std::get_if<std::shared_ptr<Container>>(&data);
  if (held == nullptr) return *data.emplace<std::shared_ptr<Container>>(std::make_shared<Container>());
  if (held->use_count() > 1) *held = std::make_shared<Container>(**held);
  return **held;
}

bool Same(const Undefined&, const Undefined&) {
  return true;
}
bool Same(const Null&, const Null&) {
  return true;
}
bool Same(const Text& one, const Text& other) {
  return one.text == other.text && one.isError == other.isError;
}
bool Same(const Date& one, const Date& other) {
  return one.milliseconds == other.milliseconds;
}
bool Same(const Bytes& one, const Bytes& other) {
  return one.bytes == other.bytes;
}
template <class T>
bool Same(const T& one, const T& other) {
  return one == other;
}

}  // namespace

ScriptValue::ScriptValue() = default;
ScriptValue::ScriptValue(const ScriptValue& other) = default;
ScriptValue::ScriptValue(ScriptValue&& other) noexcept = default;
ScriptValue& ScriptValue::operator=(const ScriptValue& other) = default;
ScriptValue& ScriptValue::operator=(ScriptValue&& other) noexcept = default;
ScriptValue::~ScriptValue() = default;

const ScriptValue::Array* ScriptValue::AsArray() const {
  const auto* held = As<std::shared_ptr<Array>>();
  return held == nullptr ? nullptr : held->get();
}

const ScriptValue::Map* ScriptValue::AsMap() const {
  const auto* held = As<std::shared_ptr<Map>>();
  return held == nullptr ? nullptr : held->get();
}

ScriptValue::Array& ScriptValue::EditArray() {
  return Edit<Array>(m_data);
}

ScriptValue::Map& ScriptValue::EditMap() {
  return Edit<Map>(m_data);
}

const ScriptValue* ScriptValue::Find(const ScriptValue& key) const {
  const Map* map = AsMap();
  if (map == nullptr) return nullptr;
  const auto found =
      std::find_if(map->begin(), map->end(), [&](const auto& entry) { return SameKey(entry.first, key); });
  return found == map->end() ? nullptr : &found->second;
}

void ScriptValue::Set(const ScriptValue& key, ScriptValue value) {
  Map& map = EditMap();
  const auto found = std::find_if(map.begin(), map.end(), [&](const auto& entry) { return SameKey(entry.first, key); });
  if (found != map.end()) {
    found->second = std::move(value);
  } else {
    map.emplace_back(key, std::move(value));
  }
}

bool SameKey(const ScriptValue& one, const ScriptValue& other) {
  return one.Get().index() == other.Get().index() &&
         std::visit([&](const auto& data) { return Same(data, std::get<std::decay_t<decltype(data)>>(other.Get())); },
                    one.Get());
}

}  // namespace engine
