#include "gui/engine_value.h"

#include <cmath>
#include <exception>
#include <limits>
#include <utility>

namespace qx::gui {
namespace {

// Reads one message; what is used up of the limits is counted over the whole of it.
class ScriptValueReader {
 public:
  explicit ScriptValueReader(const HtmlEngineApi& engine) : m_engine(engine) {}

  Value Read(const HtmlValue& value, size_t level) {
    if (level > kMostMessageLevels) throw ConversionError("The message is nested too deeply.");
    if (++m_values > kMostMessageValues) throw ConversionError("The message has too many values.");
    switch (TypeOf(value)) {
      case HTML_VALUE_BOOL:
        return Number(value) != 0;
      case HTML_VALUE_INT:
        return Number(value);
      case HTML_VALUE_FLOAT:
        return Float(value);
      case HTML_VALUE_STRING:
        return Text(value);
      case HTML_VALUE_DATE:
        return DateText(value);
      case HTML_VALUE_ARRAY:
        return Array(value, level);
      case HTML_VALUE_MAP:
        return Object(value, level);
      case HTML_VALUE_OBJECT:
        return ScriptObject(value, level);
      default:
        return {};
    }
  }

 private:
  // The engine's visitor may not be thrown through.
  struct Visit {
    ScriptValueReader* reader;
    size_t level;
    Value object = Value::EmptyObject();
    std::exception_ptr failure;
  };

  uint32_t TypeOf(const HtmlValue& value) const {
    uint32_t type = HTML_VALUE_UNDEFINED;
    uint32_t unit = 0;
    Check(m_engine.ValueType(&value, &type, &unit));
    return type;
  }
  static void Check(uint32_t result) {
    if (result != HTML_VALUE_OK) throw ConversionError("The message cannot be read.");
  }
  int32_t Number(const HtmlValue& value) const {
    int32_t number = 0;
    Check(m_engine.ValueIntData(&value, &number));
    return number;
  }
  double Float(const HtmlValue& value) const {
    double number = 0;
    Check(m_engine.ValueFloatData(&value, &number));
    return number;
  }
  std::wstring_view Text(const HtmlValue& value) {
    const wchar_t* text = nullptr;
    uint32_t length = 0;
    Check(m_engine.ValueStringData(&value, &text, &length));
    if (length > kMostMessageCharacters - m_characters) throw ConversionError("The message is too long.");
    m_characters += length;
    return text == nullptr ? std::wstring_view() : std::wstring_view(text, length);
  }
  Value DateText(const HtmlValue& value) {
    EngineValue text(m_engine, value);
    Check(m_engine.ValueToString(text.Receive(), HTML_CONVERT_SIMPLE));
    return Text(*text.Get());
  }
  Value Array(const HtmlValue& value, size_t level) {
    int32_t count = 0;
    Check(m_engine.ValueElementsCount(&value, &count));
    Value array = Value::EmptyArray();
    for (int32_t i = 0; i < count; ++i) {
      EngineValue element(m_engine);
      Check(m_engine.ValueNthElementValue(&value, i, element.Receive()));
      array.Append(Read(*element.Get(), level + 1));
    }
    return array;
  }
  Value Object(const HtmlValue& value, size_t level) {
    Visit visit{this, level, Value::EmptyObject(), nullptr};
    const uint32_t result = m_engine.ValueEnumElements(&value, &ScriptValueReader::OnMember, &visit);
    if (visit.failure) std::rethrow_exception(visit.failure);
    Check(result);
    return std::move(visit.object);
  }
  // Taken out of the script first, so that no getter of the page runs while it is read.
  Value ScriptObject(const HtmlValue& value, size_t level) {
    if (IsScriptFunction(m_engine, value)) return {};
    EngineValue plain(m_engine, value);
    if (m_engine.ValueIsolate(plain.Receive()) != HTML_VALUE_OK) return {};
    const uint32_t type = TypeOf(*plain.Get());
    if (type == HTML_VALUE_ARRAY) return Array(*plain.Get(), level);
    if (type == HTML_VALUE_MAP) return Object(*plain.Get(), level);
    return {};
  }

  static BOOL CALLBACK OnMember(void* param, const HtmlValue* key, const HtmlValue* value) {
    Visit& visit = *static_cast<Visit*>(param);
    try {
      if (visit.object.Size() >= kMostObjectMembers) throw ConversionError("An object has too many members.");
      visit.object.SetMember(visit.reader->Text(*key), visit.reader->Read(*value, visit.level + 1));
      return TRUE;
    } catch (...) {
      visit.failure = std::current_exception();
      return FALSE;
    }
  }

  const HtmlEngineApi& m_engine;
  size_t m_values = 0;
  size_t m_characters = 0;
};

class ScriptValueWriter {
 public:
  explicit ScriptValueWriter(const HtmlEngineApi& engine) : m_engine(engine) {}

  void Write(const Value& value, HtmlValue& target, size_t level) const {
    if (level > kMostMessageLevels) throw ConversionError("The value is nested too deeply.");
    switch (value.GetType()) {
      case Value::kNull:
        return WriteLiteral(L"null", target);
      case Value::kBool:
        return Check(m_engine.ValueIntDataSet(&target, value.IsTrue() ? 1 : 0, HTML_VALUE_BOOL, 0));
      case Value::kNumber:
        return WriteNumber(value.AsNumber(), target);
      case Value::kString:
        return WriteText(value.AsString(), target);
      case Value::kArray:
        return WriteArray(value, target, level);
      case Value::kObject:
        return WriteObject(value, target, level);
    }
  }

 private:
  static void Check(uint32_t result) {
    if (result != HTML_VALUE_OK) throw ConversionError("The engine does not take the value.");
  }
  // Whole numbers go as such, so that the page can use them as indexes; -0 is none of them.
  void WriteNumber(double number, HtmlValue& target) const {
    using Limits = std::numeric_limits<int32_t>;
    const bool isWhole = number >= Limits::min() && number <= Limits::max() && number == std::trunc(number) &&
                         !(number == 0 && std::signbit(number));
    Check(isWhole ? m_engine.ValueIntDataSet(&target, static_cast<int32_t>(number), HTML_VALUE_INT, 0)
                  : m_engine.ValueFloatDataSet(&target, number, HTML_VALUE_FLOAT, 0));
  }
  void WriteText(std::wstring_view text, HtmlValue& target) const {
    if (text.size() > std::numeric_limits<uint32_t>::max()) throw ConversionError("The text is too long.");
    Check(m_engine.ValueStringDataSet(&target, text.data(), static_cast<uint32_t>(text.size()), 0));
  }
  void WriteLiteral(std::wstring_view literal, HtmlValue& target) const {
    const auto length = static_cast<uint32_t>(literal.size());
    if (m_engine.ValueFromString(&target, literal.data(), length, HTML_CONVERT_JSON_LITERAL) != 0) {
      throw ConversionError("The engine does not take the value.");
    }
  }
  void WriteArray(const Value& value, HtmlValue& target, size_t level) const {
    WriteLiteral(L"[]", target);
    for (size_t i = 0; i < value.Size(); ++i) {
      EngineValue element(m_engine);
      Write(value.Element(i), *element.Receive(), level + 1);
      Check(m_engine.ValueNthElementValueSet(&target, static_cast<int32_t>(i), element.Get()));
    }
  }
  void WriteObject(const Value& value, HtmlValue& target, size_t level) const {
    WriteLiteral(L"{}", target);
    for (const String& name : value.Keys()) {
      EngineValue key(m_engine);
      EngineValue member(m_engine);
      WriteText(name, *key.Receive());
      Write(value.Member(name), *member.Receive(), level + 1);
      Check(m_engine.ValueSetValueToKey(&target, key.Get(), member.Get()));
    }
  }

  const HtmlEngineApi& m_engine;
};

}  // namespace

bool EngineValue::Invoke(const HtmlValue& argument) const {
  EngineValue result(m_engine);
  return m_engine.ValueInvoke(&m_value, nullptr, 1, &argument, result.Receive(), nullptr) == HTML_VALUE_OK;
}

Value FromEngine(const HtmlEngineApi& engine, const HtmlValue& value) {
  return ScriptValueReader(engine).Read(value, 0);
}

void ToEngine(const HtmlEngineApi& engine, const Value& value, HtmlValue& target) {
  ScriptValueWriter(engine).Write(value, target, 0);
}

bool IsScriptFunction(const HtmlEngineApi& engine, const HtmlValue& value) {
  uint32_t type = HTML_VALUE_UNDEFINED;
  uint32_t unit = 0;
  if (engine.ValueType(&value, &type, &unit) != HTML_VALUE_OK) return false;
  return type == HTML_VALUE_FUNCTION || (type == HTML_VALUE_OBJECT && unit == HTML_OBJECT_FUNCTION);
}

}  // namespace qx::gui
