#include "app/options.h"

#include <algorithm>
#include <numeric>
#include <set>
#include <string_view>
#include <utility>

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

wchar_t LowerAscii(wchar_t c) {
  return c >= L'A' && c <= L'Z' ? static_cast<wchar_t>(c - L'A' + L'a') : c;
}

// Insertions, deletions, replacements and swaps of neighbours that turn one text into the other, ASCII case aside. No
// part is edited twice (optimal string alignment).
size_t EditDistance(std::wstring_view from, std::wstring_view to) {
  const auto same = [&](size_t i, size_t j) { return LowerAscii(from[i]) == LowerAscii(to[j]); };
  std::vector<size_t> beforeLast(to.size() + 1);
  std::vector<size_t> last(to.size() + 1);
  std::vector<size_t> row(to.size() + 1);  // row[j]: from i characters to j
  std::iota(row.begin(), row.end(), size_t{0});
  for (size_t i = 1; i <= from.size(); ++i) {
    beforeLast.swap(last);
    last.swap(row);
    row[0] = i;
    for (size_t j = 1; j <= to.size(); ++j) {
      const bool isSame = same(i - 1, j - 1);
      row[j] = std::min({last[j - 1] + (isSame ? 0 : 1), row[j - 1] + 1, last[j] + 1});
      const bool isSwap = i > 1 && j > 1 && same(i - 1, j - 2) && same(i - 2, j - 1);
      if (isSwap) row[j] = std::min(row[j], beforeLast[j - 2] + 1);
    }
  }
  return row.back();
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
