#include "app/command_line.h"

namespace {

constexpr std::wstring_view kLineTerminators = L"\n\r\u2028\u2029";

std::wstring_view WithoutPrefix(std::wstring_view element) {
  for (const std::wstring_view prefix : {L"/", L"--", L"-"}) {
    if (element.starts_with(prefix)) return element.substr(prefix.size());
  }
  return element;
}

}  // namespace

std::optional<Argument> SplitArgument(std::wstring_view element) {
  element = WithoutPrefix(element);
  const size_t equals = element.find(L'=');
  if (equals == std::wstring_view::npos) return Argument{element, {}};
  const std::wstring_view value = element.substr(equals + 1);
  if (value.find_first_of(kLineTerminators) != std::wstring_view::npos) return std::nullopt;
  return Argument{element.substr(0, equals), value};
}

ArgumentMap ParseCommandLine(int count, const wchar_t* const* elements) {
  ArgumentMap arguments;
  for (int i = 0; i < count; ++i) {
    if (const auto argument = SplitArgument(elements[i])) {
      arguments[std::wstring(argument->name)].emplace_back(argument->value);
    }
  }
  return arguments;
}

bool HasArgument(const ArgumentMap& arguments, const std::wstring& name) {
  return arguments.contains(name);
}

std::wstring GetArgument(const ArgumentMap& arguments, const std::wstring& name) {
  const auto found = arguments.find(name);
  return found == arguments.end() ? std::wstring() : found->second.front();
}
