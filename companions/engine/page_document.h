// The text of a page, before the browser gets it. Includes no Windows header.
#pragma once

#include <string>
#include <string_view>

namespace engine {

// The page with a script that runs before everything of its own. The script stands behind the document type, because a
// browser takes a page that begins with anything else for one of the last century.
std::string WithLeadingScript(std::string_view html, std::string_view script);

}  // namespace engine
