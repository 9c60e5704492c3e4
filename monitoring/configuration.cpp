#include "monitoring/configuration.h"

#include <algorithm>
#include <cmath>

#include "core/json.h"
#include "core/text.h"
#include "monitoring/json_key.h"

namespace st::monitoring {
namespace {

// One kind of object: whose notes they are, and the keys that it must have, in the order in which they are checked.
struct Kind {
  const wchar_t* createFunction;
  const wchar_t* checkFunction;
  const wchar_t* invalidFormat;
};
constexpr Kind kCounter = {L"st::monitoring::PerformanceCounter::Create",
                           L"st::monitoring::PerformanceCounter::CheckFormat",
                           L"Invalid format for performance counter"};
constexpr Kind kTrigger = {L"st::monitoring::Trigger::Create", L"st::monitoring::Trigger::CheckFormat",
                           L"Invalid format for trigger"};
constexpr Kind kAction = {L"st::monitoring::Action::Create", L"st::monitoring::Action::CheckFormat",
                          L"Invalid format for action"};

struct RequiredKey {
  const char* name;
  Json::ValueType type;
  std::optional<Json::ValueType> otherType = {};  // tried when the first does not match, which leaves its note
};

bool HasKeys(const Json::Value& element, const Kind& kind, std::initializer_list<RequiredKey> keys,
             const NoteSink& note) {
  for (const RequiredKey& key : keys) {
    if (util::JsonKeyWithValueTypeExists(element, key.name, key.type, note)) continue;
    if (key.otherType && util::JsonKeyWithValueTypeExists(element, key.name, *key.otherType, note)) continue;
    note({LOG_LEVEL_TRACE, kind.checkFunction, ToWide(key.name)});
    note({LOG_LEVEL_TRACE, kind.createFunction, kind.invalidFormat});
    return false;
  }
  return true;
}

std::wstring Text(const Json::Value& element, const char* key) {
  return ToWide(element[key].asString());
}

// JSON integers have up to 64 bits; the type check does not look at that.
std::optional<int32_t> Integer(const Json::Value& element, const char* key, const Kind& kind, const NoteSink& note) {
  if (element[key].isInt()) return element[key].asInt();
  note({LOG_LEVEL_ERROR, kind.createFunction, ToWide(key) + L" is out of range"});
  return std::nullopt;
}

bool ReadIds(const Json::Value& array, const Kind& kind, const wchar_t* notText, std::vector<std::wstring>& ids,
             const NoteSink& note) {
  for (const Json::Value& id : array) {
    if (!id.isString()) {
      note({LOG_LEVEL_TRACE, kind.createFunction, notText});
      return false;
    }
    ids.push_back(ToWide(id.asString()));
  }
  return true;
}

// Not "=", though the evaluation knows it.
bool IsCondition(std::wstring_view text) {
  constexpr std::wstring_view kConditions[] = {L"<", L">", L"<=", L">=", L""};
  return std::find(std::begin(kConditions), std::end(kConditions), text) != std::end(kConditions);
}

}  // namespace

std::optional<CounterSettings> ReadCounter(const Json::Value& element, const NoteSink& note) {
  if (!HasKeys(element, kCounter,
               {{"id", Json::stringValue},
                {"query", Json::stringValue},
                {"sampleInterval", Json::intValue},
                {"triggers", Json::arrayValue}},
               note)) {
    return std::nullopt;
  }
  const std::optional<int32_t> interval = Integer(element, "sampleInterval", kCounter, note);
  if (!interval) return std::nullopt;
  CounterSettings counter;
  counter.id = Text(element, "id");
  counter.query = Text(element, "query");
  counter.sampleInterval = static_cast<uint32_t>(*interval);
  counter.saveToFile = element["saveToFile"].isBool() && element["saveToFile"].asBool();
  constexpr wchar_t kNotText[] = L"not string value in triggers array";
  if (!ReadIds(element["triggers"], kCounter, kNotText, counter.triggerIds, note)) return std::nullopt;
  return counter;
}

std::optional<TriggerSettings> ReadTrigger(const Json::Value& element, const NoteSink& note) {
  if (!HasKeys(element, kTrigger,
               {{"id", Json::stringValue},
                {"triggerAfter", Json::intValue},
                {"counterValue", Json::intValue, Json::realValue},
                {"condition", Json::stringValue},
                {"action", Json::arrayValue}},
               note)) {
    return std::nullopt;
  }
  const std::optional<int32_t> after = Integer(element, "triggerAfter", kTrigger, note);
  if (!after) return std::nullopt;
  TriggerSettings trigger;
  trigger.id = Text(element, "id");
  trigger.triggerAfter = *after;
  trigger.counterValue = element["counterValue"].asDouble();
  if (!std::isfinite(trigger.counterValue)) {  // 1e400
    note({LOG_LEVEL_ERROR, kTrigger.createFunction, L"counterValue is out of range"});
    return std::nullopt;
  }
  trigger.condition = Text(element, "condition");
  if (!IsCondition(trigger.condition)) {
    note({LOG_LEVEL_TRACE, kTrigger.createFunction, L"invalid condition"});
    return std::nullopt;
  }
  constexpr wchar_t kNotText[] = L"not string value in actions array";
  if (!ReadIds(element["action"], kTrigger, kNotText, trigger.actionIds, note)) return std::nullopt;
  return trigger;
}

std::optional<ActionSettings> ReadAction(const Json::Value& element, const NoteSink& note) {
  if (!HasKeys(element, kAction, {{"id", Json::stringValue}, {"type", Json::stringValue}}, note)) return std::nullopt;
  ActionSettings action{Text(element, "id"), element["type"].asString(), element["parameters"]};
  if (action.type != "dump") {
    note({LOG_LEVEL_TRACE, kAction.createFunction, L"Invalid action type " + ToWide(action.type)});
    return std::nullopt;
  }
  return action;
}

Json::Value ParseConfiguration(std::string_view bytes, const std::wstring& path, const NoteSink& note) {
  Json::Value document;
  std::string error;
  if (ParseJson(bytes, document, error) && document.isObject()) return document;
  if (error.empty()) error = "the document is not an object";
  note({LOG_LEVEL_ERROR, kLoadFunction, L"Invalid json format for configuration file " + path});
  note({LOG_LEVEL_ERROR, kLoadFunction, ToWide(error)});
  return Json::Value(Json::objectValue);
}

}  // namespace st::monitoring
