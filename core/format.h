// printf-style formatting of wide text with Microsoft's meaning: %s is wide, %S is narrow. The compilers' own wprintf
// families disagree on exactly that, so nothing else in the program may be used to format wide text.
#pragma once

#include <cstdarg>
#include <string>

std::wstring FormatV(const wchar_t* format, va_list arguments);
std::wstring Format(const wchar_t* format, ...);
