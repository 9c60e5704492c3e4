// What the product's logging was before it was raised, as it is kept in a marker file until it is lowered again. A
// marker that is found at the start of the program was left by a run that was killed.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace stutil {

struct ComponentLevel {
  std::string name;
  uint32_t level = 0;

  bool operator==(const ComponentLevel&) const = default;
};

struct RaisedLogging {
  std::vector<ComponentLevel> components;  // in the order of the control block
  std::optional<std::string> loggerXml;    // the whole file, byte for byte; without a value there was none to read

  bool operator==(const RaisedLogging&) const = default;
};

// The level that component `index` had under that name; 0, the level of a component that is not being looked at, when
// it was not registered then.
uint32_t FormerLevel(const RaisedLogging& former, size_t index, const std::string& name);

// The bytes of the marker file: one line of JSON, then the logger configuration as it was.
std::string WriteRaisedLogging(const RaisedLogging& former);
std::optional<RaisedLogging> ReadRaisedLogging(std::string_view bytes);

}  // namespace stutil
