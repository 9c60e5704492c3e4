// The texts of page_bridge.js and unix_watch.sh, compiled in (CMakeLists.txt).
#pragma once

namespace engine {

extern const char* const kPageBridgeScript;
extern const char* const kUnixWatchScript;

}  // namespace engine
