// Two forms of script values in JSON: the wire form, which the page's bridge (page_bridge.js) speaks and which loses
// nothing, and the plain literal that a program reads and shows. Includes no Windows header.
//
// Wire form: null, true, 1, 1.5, "text" and [..] stand for themselves; everything else is an object with one member:
//   {"m":[key,value,..]} map    {"u":0} undefined    {"n":"NaN"} a number JSON lacks    {"d":0} date
//   {"f":7} function of the page    {"e":"text"} error    {"b":"hex"} bytes
#pragma once

#include <json/value.h>

#include <string>
#include <string_view>

#include "companions/engine/script_value.h"

namespace engine {

Json::Value ToWire(const ScriptValue& value);

// What is not in the wire form becomes undefined. Functions get `home`.
ScriptValue FromWire(const Json::Value& wire, const std::weak_ptr<FunctionHome>& home);

std::wstring ToPlainText(const ScriptValue& value);  // text as it is, everything else as its literal
std::wstring ToLiteral(const ScriptValue& value);    // JSON; functions, undefined and numbers JSON lacks become null

// False, and `value` unchanged, when `text` is no JSON literal.
bool FromLiteral(std::wstring_view text, ScriptValue& value);

// "true", "false", "null", "undefined" and whole or decimal numbers become what they say, all else text.
ScriptValue FromPlainText(std::wstring_view text);

}  // namespace engine
