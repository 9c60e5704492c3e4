// The HTML engine of the process, "sciter.dll".
#pragma once

#include "interfaces/html_engine.h"

namespace qx::gui {

// The first call loads the library, which stays until the process ends. Without it there is no interactive mode: the
// process ends at once with exit code -1.
const HtmlEngineApi& Engine();

}  // namespace qx::gui
