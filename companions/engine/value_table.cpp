#include "companions/engine/value_table.h"

#include <cstring>
#include <memory>

#include "companions/engine/value_json.h"

namespace engine {
namespace {

// A record of one of these types owns a ScriptValue, to which `data` points. All others lie in `data` themselves.
bool OwnsData(uint32_t type) {
  switch (type) {
    case HTML_VALUE_STRING:
    case HTML_VALUE_ARRAY:
    case HTML_VALUE_MAP:
    case HTML_VALUE_BYTES:
    case HTML_VALUE_OBJECT:
      return true;
    default:
      return false;
  }
}

ScriptValue* Owned(const HtmlValue& value) {
  return OwnsData(value.type) ? reinterpret_cast<ScriptValue*>(value.data) : nullptr;
}

uint64_t BitsOf(double number) {
  uint64_t bits = 0;
  std::memcpy(&bits, &number, sizeof bits);
  return bits;
}

double DoubleOf(uint64_t bits) {
  double number = 0;
  std::memcpy(&number, &bits, sizeof number);
  return number;
}

// Type, unit and data of the record for each kind of value.
struct RecordOf {
  const ScriptValue& value;

  HtmlValue operator()(Undefined) const { return {HTML_VALUE_UNDEFINED, 0, 0}; }
  HtmlValue operator()(Null) const { return {HTML_VALUE_NULL, 0, 0}; }
  HtmlValue operator()(bool data) const { return {HTML_VALUE_BOOL, 0, data ? 1u : 0u}; }
  HtmlValue operator()(int32_t data) const { return {HTML_VALUE_INT, 0, static_cast<uint32_t>(data)}; }
  HtmlValue operator()(double data) const { return {HTML_VALUE_FLOAT, 0, BitsOf(data)}; }
  HtmlValue operator()(Date data) const { return {HTML_VALUE_DATE, 0, BitsOf(data.milliseconds)}; }
  HtmlValue operator()(const Text& data) const {
    return Owner(HTML_VALUE_STRING, data.isError ? HTML_STRING_ERROR : 0);
  }
  HtmlValue operator()(const Bytes&) const { return Owner(HTML_VALUE_BYTES, 0); }
  HtmlValue operator()(const std::shared_ptr<ScriptValue::Array>&) const { return Owner(HTML_VALUE_ARRAY, 0); }
  HtmlValue operator()(const std::shared_ptr<ScriptValue::Map>&) const { return Owner(HTML_VALUE_MAP, 0); }
  HtmlValue operator()(const ScriptValue::Function&) const { return Owner(HTML_VALUE_OBJECT, HTML_OBJECT_FUNCTION); }

  HtmlValue Owner(uint32_t type, uint32_t unit) const {
    // ClearValue takes it back.
    return {type, unit, reinterpret_cast<uint64_t>(std::make_unique<ScriptValue>(value).release())};
  }
};

// Nothing escapes to the caller, whatever runs out.
template <class Job>
uint32_t Guarded(Job job) noexcept {
  try {
    return job();
  } catch (...) {
    return HTML_VALUE_BAD_PARAMETER;
  }
}

uint32_t CALLBACK Init(HtmlValue* value) {
  if (value == nullptr) return HTML_VALUE_BAD_PARAMETER;
  *value = HtmlValue{};
  return HTML_VALUE_OK;
}

uint32_t CALLBACK Clear(HtmlValue* value) {
  if (value == nullptr) return HTML_VALUE_BAD_PARAMETER;
  ClearValue(*value);
  return HTML_VALUE_OK;
}

uint32_t CALLBACK Copy(HtmlValue* to, const HtmlValue* from) {
  if (to == nullptr || from == nullptr) return HTML_VALUE_BAD_PARAMETER;
  return Guarded([&] {
    if (to != from) WriteValue(ReadValue(*from), *to);
    return HTML_VALUE_OK;
  });
}

// Values have no ties to the page's objects, and functions may be let go by any thread: nothing is left to do.
uint32_t CALLBACK Isolate(HtmlValue* value) {
  return value == nullptr ? HTML_VALUE_BAD_PARAMETER : HTML_VALUE_OK;
}

uint32_t CALLBACK Type(const HtmlValue* value, uint32_t* type, uint32_t* unit) {
  if (value == nullptr || type == nullptr) return HTML_VALUE_BAD_PARAMETER;
  *type = value->type;
  if (unit != nullptr) *unit = value->unit;
  return HTML_VALUE_OK;
}

uint32_t CALLBACK StringData(const HtmlValue* value, const wchar_t** text, uint32_t* chars) {
  if (value == nullptr || text == nullptr) return HTML_VALUE_BAD_PARAMETER;
  const ScriptValue* owned = Owned(*value);
  const Text* data = owned == nullptr ? nullptr : owned->As<Text>();
  *text = data == nullptr ? L"" : data->text.c_str();
  if (chars != nullptr) *chars = data == nullptr ? 0 : static_cast<uint32_t>(data->text.size());
  return data == nullptr ? HTML_VALUE_INCOMPATIBLE_TYPE : HTML_VALUE_OK;
}

uint32_t CALLBACK StringDataSet(HtmlValue* value, const wchar_t* text, uint32_t chars, uint32_t unit) {
  if (value == nullptr || (text == nullptr && chars != 0)) return HTML_VALUE_BAD_PARAMETER;
  return Guarded([&] {
    WriteValue(ScriptValue(Text{std::wstring(text, text == nullptr ? 0 : chars), unit == HTML_STRING_ERROR}), *value);
    return HTML_VALUE_OK;
  });
}

uint32_t CALLBACK IntData(const HtmlValue* value, int32_t* data) {
  if (value == nullptr || data == nullptr) return HTML_VALUE_BAD_PARAMETER;
  if (value->type != HTML_VALUE_INT && value->type != HTML_VALUE_BOOL) return HTML_VALUE_INCOMPATIBLE_TYPE;
  *data = static_cast<int32_t>(static_cast<uint32_t>(value->data));
  return HTML_VALUE_OK;
}

uint32_t CALLBACK IntDataSet(HtmlValue* value, int32_t data, uint32_t type, uint32_t) {
  if (value == nullptr) return HTML_VALUE_BAD_PARAMETER;
  if (type != HTML_VALUE_INT && type != HTML_VALUE_BOOL) return HTML_VALUE_INCOMPATIBLE_TYPE;
  WriteValue(type == HTML_VALUE_INT ? ScriptValue(data) : ScriptValue(data != 0), *value);
  return HTML_VALUE_OK;
}

uint32_t CALLBACK FloatData(const HtmlValue* value, double* data) {
  if (value == nullptr || data == nullptr) return HTML_VALUE_BAD_PARAMETER;
  switch (value->type) {
    case HTML_VALUE_FLOAT:
    case HTML_VALUE_DATE:
      *data = DoubleOf(value->data);
      return HTML_VALUE_OK;
    case HTML_VALUE_INT:
      *data = static_cast<int32_t>(static_cast<uint32_t>(value->data));
      return HTML_VALUE_OK;
    default:
      return HTML_VALUE_INCOMPATIBLE_TYPE;
  }
}

uint32_t CALLBACK FloatDataSet(HtmlValue* value, double data, uint32_t type, uint32_t) {
  if (value == nullptr) return HTML_VALUE_BAD_PARAMETER;
  if (type != HTML_VALUE_FLOAT && type != HTML_VALUE_DATE) return HTML_VALUE_INCOMPATIBLE_TYPE;
  WriteValue(type == HTML_VALUE_FLOAT ? ScriptValue(data) : ScriptValue(Date{data}), *value);
  return HTML_VALUE_OK;
}

uint32_t CALLBACK ElementsCount(const HtmlValue* value, int32_t* count) {
  if (value == nullptr || count == nullptr) return HTML_VALUE_BAD_PARAMETER;
  *count = 0;
  const ScriptValue* owned = Owned(*value);
  if (owned == nullptr) return HTML_VALUE_INCOMPATIBLE_TYPE;
  if (const auto* array = owned->AsArray()) {
    *count = static_cast<int32_t>(array->size());
  } else if (const auto* map = owned->AsMap()) {
    *count = static_cast<int32_t>(map->size());
  } else {
    return HTML_VALUE_INCOMPATIBLE_TYPE;
  }
  return HTML_VALUE_OK;
}

// Gives `read` the n-th entry, for an array with a key of its index.
template <class Read>
uint32_t WithEntry(const HtmlValue* value, int32_t n, Read read) noexcept {
  return Guarded([&]() -> uint32_t {
    const ScriptValue* owned = Owned(*value);
    if (owned == nullptr || n < 0) return n < 0 ? HTML_VALUE_BAD_PARAMETER : HTML_VALUE_INCOMPATIBLE_TYPE;
    const auto index = static_cast<size_t>(n);
    const auto* array = owned->AsArray();
    const auto* map = owned->AsMap();
    if (array == nullptr && map == nullptr) return HTML_VALUE_INCOMPATIBLE_TYPE;
    if (index >= (array != nullptr ? array->size() : map->size())) return HTML_VALUE_BAD_PARAMETER;
    if (array != nullptr) {
      read(ScriptValue(n), (*array)[index]);
    } else {
      read((*map)[index].first, (*map)[index].second);
    }
    return HTML_VALUE_OK;
  });
}

uint32_t CALLBACK NthElementValue(const HtmlValue* value, int32_t n, HtmlValue* element) {
  if (value == nullptr || element == nullptr) return HTML_VALUE_BAD_PARAMETER;
  ScriptValue found;  // a copy: `element` may be `value` itself
  const uint32_t result = WithEntry(value, n, [&](const ScriptValue&, const ScriptValue& entry) { found = entry; });
  if (result == HTML_VALUE_OK) return Guarded([&] { return WriteValue(found, *element), HTML_VALUE_OK; });
  return result;
}

uint32_t CALLBACK NthElementKey(const HtmlValue* value, int32_t n, HtmlValue* key) {
  if (value == nullptr || key == nullptr) return HTML_VALUE_BAD_PARAMETER;
  ScriptValue found;
  const uint32_t result = WithEntry(value, n, [&](const ScriptValue& entry, const ScriptValue&) { found = entry; });
  if (result == HTML_VALUE_OK) return Guarded([&] { return WriteValue(found, *key), HTML_VALUE_OK; });
  return result;
}

constexpr size_t kLongestArray = 1 << 24;  // an index beyond it is a mistake, not a wish for so much memory

uint32_t CALLBACK NthElementValueSet(HtmlValue* value, int32_t n, const HtmlValue* element) {
  if (value == nullptr || element == nullptr || n < 0) return HTML_VALUE_BAD_PARAMETER;
  const auto index = static_cast<size_t>(n);
  if (index >= kLongestArray) return HTML_VALUE_BAD_PARAMETER;
  return Guarded([&]() -> uint32_t {
    const ScriptValue added = ReadValue(*element);
    ScriptValue changed = ReadValue(*value);
    if (const auto* map = changed.AsMap()) {
      if (index >= map->size()) return HTML_VALUE_BAD_PARAMETER;
      ClearValue(*value);  // the only other owner, so that nothing is copied
      changed.EditMap()[index].second = added;
    } else {
      ClearValue(*value);
      auto& array = changed.EditArray();
      if (index >= array.size()) array.resize(index + 1);
      array[index] = added;
    }
    WriteValue(changed, *value);
    return HTML_VALUE_OK;
  });
}

uint32_t CALLBACK EnumElements(const HtmlValue* value, HtmlElementVisitor visitor, void* param) {
  if (value == nullptr || visitor == nullptr) return HTML_VALUE_BAD_PARAMETER;
  return Guarded([&]() -> uint32_t {
    const ScriptValue held = ReadValue(*value);  // the visitor may change `value`
    HtmlValue record{};
    WriteValue(held, record);
    int32_t count = 0;
    uint32_t result = ElementsCount(&record, &count);
    BOOL goesOn = TRUE;
    for (int32_t n = 0; result == HTML_VALUE_OK && goesOn && n < count; ++n) {
      HtmlValue key{};
      HtmlValue element{};
      result = NthElementKey(&record, n, &key);
      if (result == HTML_VALUE_OK) result = NthElementValue(&record, n, &element);
      if (result == HTML_VALUE_OK) goesOn = visitor(param, &key, &element);
      ClearValue(key);
      ClearValue(element);
    }
    ClearValue(record);
    return result;
  });
}

uint32_t CALLBACK SetValueToKey(HtmlValue* value, const HtmlValue* key, const HtmlValue* element) {
  if (value == nullptr || key == nullptr || element == nullptr) return HTML_VALUE_BAD_PARAMETER;
  return Guarded([&] {
    const ScriptValue addedKey = ReadValue(*key);
    ScriptValue added = ReadValue(*element);
    ScriptValue changed = ReadValue(*value);
    ClearValue(*value);
    changed.Set(addedKey, std::move(added));
    WriteValue(changed, *value);
    return HTML_VALUE_OK;
  });
}

uint32_t CALLBACK GetValueOfKey(const HtmlValue* value, const HtmlValue* key, HtmlValue* element) {
  if (value == nullptr || key == nullptr || element == nullptr) return HTML_VALUE_BAD_PARAMETER;
  return Guarded([&]() -> uint32_t {
    const ScriptValue held = ReadValue(*value);
    if (held.AsMap() == nullptr) return HTML_VALUE_INCOMPATIBLE_TYPE;
    const ScriptValue* found = held.Find(ReadValue(*key));
    WriteValue(found == nullptr ? ScriptValue() : *found, *element);
    return HTML_VALUE_OK;
  });
}

uint32_t CALLBACK ToString(HtmlValue* value, uint32_t how) {
  if (value == nullptr || how > HTML_CONVERT_JSON_LITERAL) return HTML_VALUE_BAD_PARAMETER;
  return Guarded([&] {
    const ScriptValue held = ReadValue(*value);
    WriteValue(ScriptValue(Text{how == HTML_CONVERT_SIMPLE ? ToPlainText(held) : ToLiteral(held)}), *value);
    return HTML_VALUE_OK;
  });
}

uint32_t CALLBACK FromString(HtmlValue* value, const wchar_t* text, uint32_t chars, uint32_t how) {
  if (value == nullptr || text == nullptr) return chars;
  ScriptValue parsed;
  const bool isParsed = Guarded([&]() -> uint32_t {
                          const std::wstring_view view(text, chars);
                          if (how == HTML_CONVERT_SIMPLE) {
                            parsed = FromPlainText(view);
                          } else if (!FromLiteral(view, parsed)) {
                            return HTML_VALUE_INCOMPATIBLE_TYPE;
                          }
                          WriteValue(parsed, *value);
                          return HTML_VALUE_OK;
                        }) == HTML_VALUE_OK;
  return isParsed ? 0 : chars;
}

uint32_t CALLBACK Invoke(const HtmlValue* function, HtmlValue*, uint32_t argc, const HtmlValue* argv, HtmlValue* result,
                         const wchar_t*) {
  if (function == nullptr || (argv == nullptr && argc != 0)) return HTML_VALUE_BAD_PARAMETER;
  return Guarded([&]() -> uint32_t {
    const ScriptValue held = ReadValue(*function);
    const auto* target = held.As<ScriptValue::Function>();
    if (target == nullptr) return HTML_VALUE_INCOMPATIBLE_TYPE;
    ScriptValue::Array arguments;
    for (uint32_t i = 0; i < argc; ++i)
      arguments.push_back(ReadValue(argv[i]));
    ScriptValue answer = ScriptValue::Error(L"the page of the function is gone");
    const auto home = (*target)->Home();
    const bool isDone = home != nullptr && home->CallFunction((*target)->Id(), arguments, answer);
    if (result != nullptr) WriteValue(answer, *result);
    return isDone ? HTML_VALUE_OK : HTML_VALUE_BAD_PARAMETER;
  });
}

}  // namespace

ScriptValue ReadValue(const HtmlValue& value) {
  if (const ScriptValue* owned = Owned(value)) return *owned;
  switch (value.type) {
    case HTML_VALUE_NULL:
      return ScriptValue(Null());
    case HTML_VALUE_BOOL:
      return ScriptValue(value.data != 0);
    case HTML_VALUE_INT:
      return ScriptValue(static_cast<int32_t>(static_cast<uint32_t>(value.data)));
    case HTML_VALUE_FLOAT:
      return ScriptValue(DoubleOf(value.data));
    case HTML_VALUE_DATE:
      return ScriptValue(Date{DoubleOf(value.data)});
    default:
      return {};
  }
}

void WriteValue(const ScriptValue& from, HtmlValue& value) {
  const HtmlValue made = std::visit(RecordOf{from}, from.Get());
  ClearValue(value);
  value = made;
}

void ClearValue(HtmlValue& value) noexcept {
  const std::unique_ptr<ScriptValue> owner(Owned(value));
  value = HtmlValue{};
}

void FillValueTable(HtmlEngineApi& api) {
  api.ValueInit = &Init;
  api.ValueClear = &Clear;
  api.ValueCopy = &Copy;
  api.ValueIsolate = &Isolate;
  api.ValueType = &Type;
  api.ValueStringData = &StringData;
  api.ValueStringDataSet = &StringDataSet;
  api.ValueIntData = &IntData;
  api.ValueIntDataSet = &IntDataSet;
  api.ValueFloatData = &FloatData;
  api.ValueFloatDataSet = &FloatDataSet;
  api.ValueElementsCount = &ElementsCount;
  api.ValueNthElementValue = &NthElementValue;
  api.ValueNthElementValueSet = &NthElementValueSet;
  api.ValueNthElementKey = &NthElementKey;
  api.ValueEnumElements = &EnumElements;
  api.ValueSetValueToKey = &SetValueToKey;
  api.ValueGetValueOfKey = &GetValueOfKey;
  api.ValueToString = &ToString;
  api.ValueFromString = &FromString;
  api.ValueInvoke = &Invoke;
}

}  // namespace engine
