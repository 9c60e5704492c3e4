// The elements of a command line, one a line.
#include "app/command_line.h"

#include "app/options.h"
#include "core/text.h"
#include "tests/fuzz/fuzz.h"

namespace {

void CheckArgument(std::wstring_view element) {
  const auto argument = SplitArgument(element);
  const bool hasEquals = element.find(L'=') != std::wstring_view::npos;
  if (!argument) {
    PROMISE(hasEquals);  // only a value can make an element none
    return;
  }
  PROMISE(argument->name.find(L'=') == std::wstring_view::npos);
  const std::wstring rest = std::wstring(argument->name) + (hasEquals ? L"=" : L"") + std::wstring(argument->value);
  PROMISE(element.ends_with(rest) && element.size() - rest.size() <= 2);
}

}  // namespace

void FuzzOne(std::string_view bytes) {
  std::vector<std::wstring> texts;
  for (Input input(bytes); !input.IsEmpty();) {
    std::wstring text = ToWide(input.TakeLine());
    std::replace(text.begin(), text.end(), L'\v', L'\n');  // so that a value can hold a line break
    CheckArgument(text);
    texts.push_back(std::move(text));
  }
  std::vector<const wchar_t*> elements;
  elements.reserve(texts.size());
  for (const std::wstring& text : texts)
    elements.push_back(text.c_str());
  const int count = static_cast<int>(elements.size());

  const ArgumentMap arguments = ParseCommandLine(count, elements.data());
  size_t values = 0;
  for (const auto& [name, given] : arguments)
    values += given.size();
  PROMISE(values <= texts.size());
  SelectMode(arguments);
  for (const Option& option : options::kAll) {
    bool isOn = false;
    std::wstring text;
    if (option.kind == OptionKind::kSwitch) ReadSwitch(arguments, option, isOn);
    if (option.kind == OptionKind::kText) ReadText(arguments, option, text);
    PROMISE((!isOn && text.empty()) || IsGiven(arguments, option));
  }
  for (const std::wstring& warning : CommandLineWarnings(count, elements.data())) {
    PROMISE(warning.size() < 300);
    PROMISE(std::none_of(warning.begin(), warning.end(), [](wchar_t c) { return c < L' '; }));
  }
}
