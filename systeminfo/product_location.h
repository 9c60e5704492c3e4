// Where the maker's product is installed, by the list of programs to uninstall.
#pragma once

#include <json/value.h>

#include <string>

namespace systeminfo {

// The install location of the first entry, in the registry's order, that belongs to the product and has one. Empty, and
// logged, when there is none.
std::wstring GetProductInstallLocation();

enum class UninstallEntry { kOther, kProductWithoutLocation, kProduct };

// The rule for one entry; `values` maps value names in lower case to texts. A location that is no absolute path is
// none.
UninstallEntry ClassifyUninstallEntry(const Json::Value& values);

}  // namespace systeminfo
