#include "app/options.h"

#include <algorithm>
#include <set>
#include <string_view>
#include <utility>

#include "core/edit_distance.h"

namespace {

struct KnownName {
  std::wstring name;
  bool takesValue;
};

std::vector<KnownName> KnownNames() {
  std::vector<KnownName> names;
  for (const Option& option : options::kAll) {
    for (const std::wstring name : {option.name, option.shortName}) {
      if (name.empty()) continue;
      names.push_back({name, option.kind == OptionKind::kText});
      if (option.kind == OptionKind::kSwitch) names.push_back({L"no" + name, false});
    }
  }
  return names;
}

// Names come from outside and may be as long as a command line; a line shows, and the distance sees, this much of one.
constexpr size_t kLongestShown = 60;

std::wstring Shown(std::wstring_view text) {
  std::wstring shown(text.substr(0, kLongestShown));
  std::replace_if(
      shown.begin(), shown.end(), [](wchar_t c) { return c < L' '; }, L' ');
  if (text.size() > kLongestShown) shown += L"...";
  return shown;
}

std::wstring NearestName(const std::vector<KnownName>& known, std::wstring_view name) {
  name = name.substr(0, kLongestShown);
  const auto nearest = std::min_element(known.begin(), known.end(), [name](const KnownName& a, const KnownName& b) {
    return EditDistance(name, a.name) < EditDistance(name, b.name);
  });
  return nearest->name;
}

// The warning for one element, or an empty text.
std::wstring WarningFor(std::wstring_view element, const std::vector<KnownName>& known) {
  const auto argument = SplitArgument(element);
  if (!argument) return L"argument '" + Shown(element) + L"' is ignored: its value has a line break";
  if (argument->name.empty()) {
    return element.empty() ? std::wstring() : L"argument '" + Shown(element) + L"' is ignored: it has no name";
  }
  const auto found =
      std::find_if(known.begin(), known.end(), [&](const KnownName& k) { return k.name == argument->name; });
  if (found == known.end()) {
    return L"unknown option '" + Shown(argument->name) + L"' is ignored; the nearest known option is '" +
           NearestName(known, argument->name) + L"'";
  }
  if (!found->takesValue && !argument->value.empty()) {
    return L"option '" + found->name + L"' takes no value; '" + Shown(argument->value) + L"' is ignored";
  }
  return {};
}

}  // namespace

bool IsGiven(const ArgumentMap& arguments, const Option& word) {
  return HasArgument(arguments, word.name) || (*word.shortName != L'\0' && HasArgument(arguments, word.shortName));
}

void ReadText(const ArgumentMap& arguments, const Option& text, std::wstring& field) {
  if (HasArgument(arguments, text.name)) field = GetArgument(arguments, text.name);
  if (HasArgument(arguments, text.shortName)) field = GetArgument(arguments, text.shortName);
}

void ReadSwitch(const ArgumentMap& arguments, const Option& option, bool& field) {
  const std::wstring no = L"no";
  if (HasArgument(arguments, option.name)) field = true;
  if (HasArgument(arguments, no + option.name)) field = false;
  if (HasArgument(arguments, option.shortName)) field = true;
  if (HasArgument(arguments, no + option.shortName)) field = false;
}

Mode SelectMode(const ArgumentMap& arguments) {
  if (IsGiven(arguments, options::kNoGui) || IsGiven(arguments, options::kSilent)) return Mode::kNoGui;
  if (IsGiven(arguments, options::kMonitoring)) return Mode::kMonitoring;
  return Mode::kGui;
}

std::vector<std::wstring> CommandLineWarnings(int count, const wchar_t* const* elements) {
  const std::vector<KnownName> known = KnownNames();
  std::vector<std::wstring> warnings;
  std::set<std::wstring> seen;
  for (int i = 0; i < count; ++i) {
    std::wstring warning = WarningFor(elements[i], known);
    if (!warning.empty() && seen.insert(warning).second) warnings.push_back(std::move(warning));
  }
  return warnings;
}
