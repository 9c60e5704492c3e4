// The only conversion between the program's own text (UTF-16) and the UTF-8 of JSON, zip, XML and upload libraries.
// Ill-formed input is never an error: each bad unit becomes U+FFFD, so that text from outside always gets through.
#pragma once

#include <string>
#include <string_view>

std::string ToUtf8(std::wstring_view text);
std::wstring ToWide(std::string_view utf8);
