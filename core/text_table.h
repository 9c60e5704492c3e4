// Texts by key, as files of settings and translations hold them: one JSON object whose members are all strings.
#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <string>
#include <string_view>

using TextTable = std::map<std::wstring, std::wstring, std::less<>>;

// False when the text is anything else; `error` says what. UTF-8.
bool ParseTextTable(std::string_view json, TextTable& table, std::string& error);

// Reads such a file. 0 or a Windows error number, ERROR_BAD_FORMAT when it is none; `error` then says why.
uint32_t ReadTextTable(std::wstring_view path, TextTable& table, std::string& error);

// Hands a text out through a C interface: `*chars` is the room and becomes the length, both with the terminating zero.
// 0, ERROR_INVALID_PARAMETER, or ERROR_INSUFFICIENT_BUFFER with nothing written.
uint32_t CopyText(std::wstring_view text, wchar_t* buffer, uint32_t* chars);

// The opposite way: calls `get` (buffer, chars -> Windows error number) with as much room as it asks for.
using TextGetter = std::function<uint32_t(wchar_t* buffer, uint32_t* chars)>;
uint32_t FetchText(const TextGetter& get, std::wstring& text);
