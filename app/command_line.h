// The command line as a map of named arguments. Portable and pure: the entry point splits the raw command line with the
// system's rules and hands the elements in here. Names are compared exactly; "NoGui" is not "nogui".
#pragma once

#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

// From an argument's name to its values in the order in which they were given. Every occurrence of a name adds one
// value, an empty one when there is no "=".
using ArgumentMap = std::map<std::wstring, std::vector<std::wstring>>;

struct Argument {
  std::wstring_view name;
  std::wstring_view value;
};

// One element: an optional "/", "--" or "-", a name up to the first "=", and everything behind it as the value, as the
// ECMAScript expression "(/|--|-)?([^=]*)(=(.*))?" matches a whole element. Only one prefix is dropped: "---x" has the
// name "-x". The expression's "." takes no line break, so an element with one in its value does not match and is no
// argument at all; a line break in the name is nothing special. The views point into `element`.
std::optional<Argument> SplitArgument(std::wstring_view element);

// All elements from the first on; there is no program name among them. Elements that do not match are left out.
ArgumentMap ParseCommandLine(int count, const wchar_t* const* elements);

bool HasArgument(const ArgumentMap& arguments, const std::wstring& name);

// The first value of a name; empty when the name is absent.
std::wstring GetArgument(const ArgumentMap& arguments, const std::wstring& name);
