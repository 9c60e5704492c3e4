// Replaces variables in paths as the registry and settings files hold them: "%programfiles%\x" and the like. A fixed
// set of names stands for the system's and the user's folders; every other name is an environment variable.
#pragma once

#include <functional>
#include <optional>
#include <string>
#include <string_view>

namespace utils {

// The names (see folder_variables.cpp) match in any case. A folder comes in lower case, an environment variable and the
// text around the variables as they are. A variable that is neither stays as it stands. Any thread may call it; the
// folders are asked for once.
std::wstring ExpandFolderVariables(std::wstring_view text);

// The rule alone: every %name% for which `lookup` has a value is replaced by it. A percent sign that opens no known
// variable stays, and the next one may open one: "100% of %windir%" has one variable.
using VariableLookup = std::function<std::optional<std::wstring>(std::wstring_view name)>;
std::wstring ExpandVariables(std::wstring_view text, const VariableLookup& lookup);

}  // namespace utils
