// The product's own XML files, read from its folder. What they mean is decided in product_xml.h; here is what is logged
// when they do not say it.
#pragma once

#include <json/value.h>

#include <string>
#include <string_view>

namespace systeminfo {

// The folder of the product's crash dumps as the crash handler's settings file says it: environment variables are not
// expanded, and it may be relative. Empty when it is not found.
std::wstring GetDumpFullPath(const std::wstring& settingsFile);

// When the product last looked for and applied updates, by "update_statistics.xml" in `folder`: the object of
// UpdateStatistics::elements, empty on any failure.
Json::Value GetLastUpdate(std::wstring_view folder);

}  // namespace systeminfo
