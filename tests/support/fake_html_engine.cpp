#include "tests/support/fake_html_engine.h"

#include <stdexcept>

namespace {

FakeHtmlEngine* g_engine = nullptr;

using Node = FakeHtmlEngine::Node;

bool IsFunction(const Node& node) {
  return node.type == HTML_VALUE_OBJECT && node.unit == HTML_OBJECT_FUNCTION;
}

std::vector<qx::Value> Plain(FakeHtmlEngine& engine, const HtmlValue* values, uint32_t count) {
  std::vector<qx::Value> plain;
  plain.reserve(count);
  for (uint32_t i = 0; i < count; ++i)
    plain.push_back(engine.Of(values[i]).ToValue());
  return plain;
}

}  // namespace

// The functions of the table.
struct FakeHtmlEngineTable {
  static Node& Get(const HtmlValue* value) {
    static Node s_undefined;
    if (std::this_thread::get_id() != g_engine->m_thread) ++g_engine->callsFromOtherThreads;
    if (value->data == 0) return s_undefined = Node();
    const auto found = g_engine->m_values.find(value->data);
    if (found == g_engine->m_values.end()) throw std::logic_error("a script value was used after its end");
    return found->second;
  }
  // The value's place for a new content.
  static Node& Put(HtmlValue* value) {
    if (value->data == 0) value->data = ++g_engine->m_lastId;
    return g_engine->m_values[value->data] = Node();
  }
  static void Assign(HtmlValue* to, const Node& node) {
    const Node copy = node;
    if (copy.type == HTML_VALUE_UNDEFINED) {
      Clear(to);
    } else {
      Put(to) = copy;
    }
  }

  static uint32_t CALLBACK Init(HtmlValue* value) {
    *value = {};
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK Clear(HtmlValue* value) {
    Get(value);
    g_engine->m_values.erase(value->data);
    *value = {};
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK Copy(HtmlValue* to, const HtmlValue* from) {
    Assign(to, Get(from));
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK Isolate(HtmlValue* value) {
    Node& node = Get(value);
    if (node.type != HTML_VALUE_OBJECT) return HTML_VALUE_OK;
    if (node.unit == HTML_OBJECT_ARRAY) node.type = HTML_VALUE_ARRAY;
    if (node.unit == HTML_OBJECT_OBJECT) node.type = HTML_VALUE_MAP;
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK Type(const HtmlValue* value, uint32_t* type, uint32_t* unit) {
    *type = Get(value).type;
    *unit = Get(value).unit;
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK StringData(const HtmlValue* value, const wchar_t** text, uint32_t* chars) {
    const Node& node = Get(value);
    if (node.type != HTML_VALUE_STRING) return HTML_VALUE_INCOMPATIBLE_TYPE;
    *text = node.text.c_str();
    *chars = static_cast<uint32_t>(node.text.size());
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK StringDataSet(HtmlValue* value, const wchar_t* text, uint32_t chars, uint32_t unit) {
    const std::wstring copy(text, chars);
    Node& node = Put(value);
    node.type = HTML_VALUE_STRING;
    node.unit = unit;
    node.text = copy;
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK IntData(const HtmlValue* value, int32_t* data) {
    const Node& node = Get(value);
    if (node.type != HTML_VALUE_INT && node.type != HTML_VALUE_BOOL) return HTML_VALUE_INCOMPATIBLE_TYPE;
    *data = static_cast<int32_t>(node.number);
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK IntDataSet(HtmlValue* value, int32_t data, uint32_t type, uint32_t unit) {
    return FloatDataSet(value, data, type, unit);
  }
  static uint32_t CALLBACK FloatData(const HtmlValue* value, double* data) {
    if (Get(value).type != HTML_VALUE_FLOAT) return HTML_VALUE_INCOMPATIBLE_TYPE;
    *data = Get(value).number;
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK FloatDataSet(HtmlValue* value, double data, uint32_t type, uint32_t unit) {
    Node& node = Put(value);
    node.type = type;
    node.unit = unit;
    node.number = data;
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK ElementsCount(const HtmlValue* value, int32_t* count) {
    const Node& node = Get(value);
    if (node.type != HTML_VALUE_ARRAY && node.type != HTML_VALUE_MAP) return HTML_VALUE_INCOMPATIBLE_TYPE;
    *count = static_cast<int32_t>(node.type == HTML_VALUE_ARRAY ? node.elements.size() : node.members.size());
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK NthElementValue(const HtmlValue* value, int32_t n, HtmlValue* element) {
    const Node& node = Get(value);
    if (n < 0 || static_cast<size_t>(n) >= node.elements.size()) return HTML_VALUE_BAD_PARAMETER;
    Assign(element, node.elements[static_cast<size_t>(n)]);
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK NthElementValueSet(HtmlValue* value, int32_t n, const HtmlValue* element) {
    const Node copy = Get(element);
    Node& node = Get(value).type == HTML_VALUE_ARRAY ? Get(value) : Put(value);
    node.type = HTML_VALUE_ARRAY;
    if (node.elements.size() <= static_cast<size_t>(n)) node.elements.resize(static_cast<size_t>(n) + 1);
    node.elements[static_cast<size_t>(n)] = copy;
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK EnumElements(const HtmlValue* value, HtmlElementVisitor visitor, void* param) {
    const Node& node = Get(value);
    if (node.type != HTML_VALUE_MAP) return HTML_VALUE_INCOMPATIBLE_TYPE;
    for (const auto& [name, member] : node.members) {
      HtmlValue key = g_engine->Make(Node::From(qx::Value(name)));
      HtmlValue element = g_engine->Make(member);
      const BOOL goOn = visitor(param, &key, &element);
      Clear(&key);
      Clear(&element);
      if (!goOn) break;
    }
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK SetValueToKey(HtmlValue* value, const HtmlValue* key, const HtmlValue* element) {
    const std::wstring name = Get(key).text;
    const Node copy = Get(element);
    Node& node = Get(value).type == HTML_VALUE_MAP ? Get(value) : Put(value);
    node.type = HTML_VALUE_MAP;
    node.members.emplace_back(name, copy);
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK ToString(HtmlValue* value, uint32_t) {
    Node& node = Get(value);
    node.type = HTML_VALUE_STRING;
    return HTML_VALUE_OK;
  }
  static uint32_t CALLBACK FromString(HtmlValue* value, const wchar_t* text, uint32_t chars, uint32_t) {
    const std::wstring literal(text, chars);
    Node& node = Put(value);
    if (literal == L"null") node.type = HTML_VALUE_NULL;
    if (literal == L"[]") node.type = HTML_VALUE_ARRAY;
    if (literal == L"{}") node.type = HTML_VALUE_MAP;
    return node.type == HTML_VALUE_UNDEFINED ? chars : 0;
  }
  static uint32_t CALLBACK Invoke(const HtmlValue* function, HtmlValue*, uint32_t argc, const HtmlValue* argv,
                                  HtmlValue* result, const wchar_t*) {
    const Node node = Get(function);
    if (!IsFunction(node)) return HTML_VALUE_INCOMPATIBLE_TYPE;
    Assign(result, Node::From(node.function(Plain(*g_engine, argv, argc))));
    return HTML_VALUE_OK;
  }

  static LRESULT CALLBACK ProcND(HWND, UINT, WPARAM, LPARAM, BOOL* handled) {
    *handled = FALSE;
    return 0;
  }
  static BOOL CALLBACK LoadFile(HWND, const wchar_t* address) {
    g_engine->loaded.emplace_back(address);
    return g_engine->loads;
  }
  static void CALLBACK SetCallback(HWND, HtmlHostCallback callback, void* param) {
    g_engine->callback = callback;
    g_engine->callbackParam = param;
  }
  static BOOL CALLBACK DataReady(HWND, const wchar_t*, const uint8_t* bytes, uint32_t size) {
    g_engine->supplied.assign(reinterpret_cast<const char*>(bytes), size);
    return TRUE;
  }
  static BOOL CALLBACK Call(HWND, const char* name, uint32_t argc, const HtmlValue* argv, HtmlValue* result) {
    if (std::this_thread::get_id() != g_engine->m_thread) ++g_engine->callsFromOtherThreads;
    const auto found = g_engine->functions.find(name);
    if (found == g_engine->functions.end()) return FALSE;
    const FakeHtmlEngine::Function function = found->second;
    Assign(result, Node::From(function(Plain(*g_engine, argv, argc))));
    return TRUE;
  }
  static void CALLBACK SetupDebugOutput(HWND, void* param, HtmlDebugOutput output) {
    g_engine->debugOutput = output;
    g_engine->debugParam = param;
  }
  static int CALLBACK GetRootElement(HWND, HtmlElement* element) {
    *element = g_engine;
    return 0;
  }
  static int CALLBACK GetElementLocation(HtmlElement, RECT* location, uint32_t) {
    *location = g_engine->root;
    return 0;
  }
  static int CALLBACK AttachEventHandler(HWND, HtmlEventProc proc, void* tag, uint32_t) {
    g_engine->eventProc = proc;
    g_engine->eventTag = tag;
    return 0;
  }
};

FakeHtmlEngine::FakeHtmlEngine() {
  using Table = FakeHtmlEngineTable;
  g_engine = this;
  m_api.SciterDataReady = &Table::DataReady;
  m_api.SciterProcND = &Table::ProcND;
  m_api.SciterLoadFile = &Table::LoadFile;
  m_api.SciterSetCallback = &Table::SetCallback;
  m_api.SciterCall = &Table::Call;
  m_api.SciterSetupDebugOutput = &Table::SetupDebugOutput;
  m_api.SciterGetRootElement = &Table::GetRootElement;
  m_api.SciterGetElementLocation = &Table::GetElementLocation;
  m_api.SciterWindowAttachEventHandler = &Table::AttachEventHandler;
  m_api.ValueInit = &Table::Init;
  m_api.ValueClear = &Table::Clear;
  m_api.ValueCopy = &Table::Copy;
  m_api.ValueIsolate = &Table::Isolate;
  m_api.ValueType = &Table::Type;
  m_api.ValueStringData = &Table::StringData;
  m_api.ValueStringDataSet = &Table::StringDataSet;
  m_api.ValueIntData = &Table::IntData;
  m_api.ValueIntDataSet = &Table::IntDataSet;
  m_api.ValueFloatData = &Table::FloatData;
  m_api.ValueFloatDataSet = &Table::FloatDataSet;
  m_api.ValueElementsCount = &Table::ElementsCount;
  m_api.ValueNthElementValue = &Table::NthElementValue;
  m_api.ValueNthElementValueSet = &Table::NthElementValueSet;
  m_api.ValueEnumElements = &Table::EnumElements;
  m_api.ValueSetValueToKey = &Table::SetValueToKey;
  m_api.ValueToString = &Table::ToString;
  m_api.ValueFromString = &Table::FromString;
  m_api.ValueInvoke = &Table::Invoke;
}

FakeHtmlEngine::~FakeHtmlEngine() {
  g_engine = nullptr;
}

qx::Value FakeHtmlEngine::CallNative(const std::string& name, const std::vector<Node>& arguments) {
  std::vector<HtmlValue> values;
  values.reserve(arguments.size());
  for (const Node& argument : arguments)
    values.push_back(Make(argument));
  HtmlScriptCall call{name.c_str(), values.data(), static_cast<uint32_t>(values.size()), {}};
  if (!eventProc(eventTag, nullptr, HTML_EVENTS_SCRIPT_CALL, &call)) throw std::runtime_error("the call was not taken");
  qx::Value result = Of(call.result).ToValue();
  Clear(call.result);
  for (HtmlValue& value : values)
    Clear(value);
  return result;
}

HtmlValue FakeHtmlEngine::Make(const Node& node) {
  HtmlValue value{};
  FakeHtmlEngineTable::Assign(&value, node);
  return value;
}

const FakeHtmlEngine::Node& FakeHtmlEngine::Of(const HtmlValue& value) const {
  return FakeHtmlEngineTable::Get(&value);
}

void FakeHtmlEngine::Clear(HtmlValue& value) {
  FakeHtmlEngineTable::Clear(&value);
}

Node::Node() = default;
Node::Node(const Node& other) = default;
Node::Node(Node&& other) noexcept = default;
Node& Node::operator=(const Node& other) = default;
Node& Node::operator=(Node&& other) noexcept = default;
Node::~Node() = default;

Node Node::Int(int value) {
  Node node;
  node.type = HTML_VALUE_INT;
  node.number = value;
  return node;
}

Node Node::Callable(Function function) {
  Node node;
  node.type = HTML_VALUE_OBJECT;
  node.unit = HTML_OBJECT_FUNCTION;
  node.function = std::move(function);
  return node;
}

Node Node::From(const qx::Value& value) {
  Node node;
  switch (value.GetType()) {
    case qx::Value::kNull:
      node.type = HTML_VALUE_NULL;
      break;
    case qx::Value::kBool:
      node.type = HTML_VALUE_BOOL;
      node.number = value.IsTrue() ? 1 : 0;
      break;
    case qx::Value::kNumber:
      node.type = HTML_VALUE_FLOAT;
      node.number = value.AsNumber();
      break;
    case qx::Value::kString:
      node.type = HTML_VALUE_STRING;
      node.text = value.AsString();
      break;
    case qx::Value::kArray:
      node.type = HTML_VALUE_ARRAY;
      for (size_t i = 0; i < value.Size(); ++i)
        node.elements.push_back(From(value.Element(i)));
      break;
    case qx::Value::kObject:
      node.type = HTML_VALUE_MAP;
      for (const qx::String& key : value.Keys())
        node.members.emplace_back(std::wstring(key), From(value.Member(key)));
      break;
  }
  return node;
}

qx::Value Node::ToValue() const {
  switch (type) {
    case HTML_VALUE_BOOL:
      return number != 0;
    case HTML_VALUE_INT:
    case HTML_VALUE_FLOAT:
      return number;
    case HTML_VALUE_STRING:
      return text;
    case HTML_VALUE_ARRAY: {
      qx::Value array = qx::Value::EmptyArray();
      for (const Node& element : elements)
        array.Append(element.ToValue());
      return array;
    }
    case HTML_VALUE_MAP: {
      qx::Value object = qx::Value::EmptyObject();
      for (const auto& [name, member] : members)
        object.SetMember(name, member.ToValue());
      return object;
    }
    default:
      return {};
  }
}
