// Reading and writing JSON text. All JSON of the program goes through these functions, so that one place decides what
// is accepted and how files look. UTF-8 in and out.
#pragma once

#include <json/value.h>

#include <functional>
#include <string>
#include <string_view>

// Comments and a UTF-8 byte-order mark are accepted and dropped. False when `text` is not a JSON document, or nests
// deeper than 1,000 levels; `error` then holds the reader's message, several lines, and `value` is null. What follows
// the end of the document is not looked at, as the library's reader has it.
bool ParseJson(std::string_view text, Json::Value& value, std::string& error);

// Two layouts, byte for byte those of the library's StyledWriter and FastWriter, which people compare and scripts read.
// Comments in `value` are not written.
std::string WriteStyledJson(const Json::Value& value);   // indented by 3 spaces, right margin 74 columns
std::string WriteCompactJson(const Json::Value& value);  // one line, ended by a newline

// Adds a value without content of its own (null, text, a number or a truth value) as it stands in both layouts: ASCII
// only, so that whatever follows it may be joined by hand.
void AppendJsonScalar(std::string& out, const Json::Value& value);

// The same for a document whose text is not to be held in memory. The sink gets the text piece by piece, each about 64
// KiB (more when one string is longer), and ends the writing by returning false.
using JsonSink = std::function<bool(std::string_view piece)>;
void WriteStyledJson(const Json::Value& value, const JsonSink& sink);
void WriteCompactJson(const Json::Value& value, const JsonSink& sink);
