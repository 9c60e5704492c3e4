// Turns one COM VARIANT, as WMI returns property values, into a JSON value. The integer rules are odd and stay as they
// are: what reads the collected files knows them.
#pragma once

#include <windows.h>

#include <json/value.h>
#include <oleauto.h>

// VT_EMPTY, VT_NULL    null
// VT_I2                integer 0 to 65535: the 16 bits read as unsigned (-1 becomes 65535)
// VT_I4                unsigned integer: the 32 bits read as unsigned (-1 becomes 4294967295)
// VT_BOOL              integer, not a JSON boolean: true is -1, false is 0
// VT_UI1               integer: the 16-bit word at the start of the value, read as signed
// VT_BSTR              string; a null BSTR is an empty string
// VT_ARRAY | VT_BSTR   array of strings, as many as the array's cbElements says and not as its bounds say: 8 on 64-bit
//                      Windows. Beyond the array's end its last string is repeated.
// anything else        null, and a logged warning
// Dates, 64-bit integers and reals come from WMI as VT_BSTR.
Json::Value VariantToJsonValue(const VARIANT& variant);
