// The list of all collectors, in the order in which they run.
#pragma once

#include <memory>
#include <span>
#include <string>

#include "systeminfo/collector.h"

namespace systeminfo {

struct CollectorRow {
  const wchar_t* key;        // of the settings; also the collector's name. Two rows may share one.
  const wchar_t* className;  // for the manifest
  std::shared_ptr<ICollector> (*make)(std::wstring name);
};

std::span<const CollectorRow> CollectorTable();

}  // namespace systeminfo
