#include "report/arguments.h"

#include <iterator>

#include "core/text.h"

namespace report {
namespace {

struct TextOption {
  const wchar_t* name;
  std::wstring Arguments::*member;
};
struct Switch {
  const wchar_t* name;
  bool Arguments::*member;
};

constexpr TextOption kTextOptions[] = {{L"--key", &Arguments::keyFile},
                                       {L"--extract", &Arguments::extractFolder},
                                       {L"--compare", &Arguments::other},
                                       {L"-o", &Arguments::reportFile}};
constexpr Switch kSwitches[] = {
    {L"--json", &Arguments::asJson}, {L"--help", &Arguments::showHelp}, {L"--version", &Arguments::showVersion}};

template <class Table>
auto FindOption(const Table& table, const std::wstring& name) {
  const auto* row = std::begin(table);
  while (row != std::end(table) && name != row->name)
    ++row;
  return row == std::end(table) ? nullptr : row;
}

}  // namespace

std::string ParseArguments(const std::vector<std::wstring>& elements, Arguments& arguments) {
  bool hasOptions = true;
  for (size_t i = 0; i < elements.size(); ++i) {
    const std::wstring& element = elements[i];
    if (hasOptions && element == L"--") {
      hasOptions = false;
    } else if (const Switch* const found = hasOptions ? FindOption(kSwitches, element) : nullptr) {
      arguments.*found->member = true;
    } else if (const TextOption* const text = hasOptions ? FindOption(kTextOptions, element) : nullptr) {
      if (i + 1 == elements.size() || elements[i + 1].empty()) return ToUtf8(element) + " needs a name behind it.";
      arguments.*text->member = elements[++i];
    } else if (hasOptions && element.starts_with(L"-")) {
      return "There is no option " + ToUtf8(element) + ".";
    } else if (!arguments.input.empty()) {
      return "Only one package can be opened at a time; " + ToUtf8(element) + " is one more.";
    } else {
      arguments.input = element;
    }
  }
  const bool isQuestion = arguments.showHelp || arguments.showVersion;
  return arguments.input.empty() && !isQuestion ? "Name a package, a zip archive or a folder." : std::string();
}

std::string HelpText() {
  return "usage: support_report PACKAGE [--key FILE] [-o REPORT] [--compare OTHER] [--extract FOLDER] [--json]\n"
         "\n"
         "Opens a collection of the support tool and says what is wrong with the computer.\n"
         "\n"
         "  PACKAGE           an encrypted package, a zip archive, or a folder with an unpacked one\n"
         "  --key FILE        the private key that opens the package (PEM, \"RSA PRIVATE KEY\")\n"
         "  -o REPORT         writes all that was collected, with the findings, as one HTML file, in place of the "
         "text\n"
         "  --compare OTHER   says too what changed since (or until) another collection of the same computer\n"
         "  --extract FOLDER  unpacks into FOLDER too, which must be new or empty\n"
         "  --json            prints the findings and changes as JSON\n"
         "  --help            prints this text\n"
         "  --version         prints the version\n"
         "\n"
         "Exit codes: 0 nothing found, 1 findings, 2 bad input, 3 wrong key.\n";
}

}  // namespace report
