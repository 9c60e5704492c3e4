// A WMI class as a JSON table: which of its properties go in, under which names, and what a property that cannot be
// read costs. A collector whose facts are such tables is a list of columns and one call.
#pragma once

#include <json/value.h>

#include <span>

#include "systeminfo/wmi_wrapper.h"

namespace systeminfo {

struct WmiColumn {
  const wchar_t* property;
  const wchar_t* member = nullptr;  // of the row's object; null: named as the property
};

// What a property that cannot be read leaves behind. The wrapper has then logged it.
enum class Hole {
  kIsNull,      // its member is null
  kDropsRow,    // its instance is not reported
  kDropsTable,  // nothing is reported
};

struct WmiTable {
  const wchar_t* query;
  std::span<const WmiColumn> columns;
  Hole hole;
  const wchar_t* function;  // who asks, for the log line of a hole that drops something
};

// Sets `rows` to an array with one object for each instance, in WMI's order and with every member; to null when a hole
// dropped the table. False when the query failed; `rows` then holds what came before that.
bool ReadWmiTable(WMIWrapper& wmi, const WmiTable& table, Json::Value& rows);

}  // namespace systeminfo
