// The run parameters that a command line makes, and how they are printed. Elements are lines.
#include "app/run_parameters.h"

#include "core/text.h"
#include "tests/fuzz/fuzz.h"

namespace {

size_t Lines(std::wstring_view text) {
  return static_cast<size_t>(std::count(text.begin(), text.end(), L'\n'));
}

}  // namespace

void FuzzOne(std::string_view bytes) {
  ArgumentMap arguments;
  for (Input input(bytes); !input.IsEmpty();) {
    std::wstring text = ToWide(input.TakeLine());
    text.resize(std::min(text.find(L'\0'), text.size()));  // as an element of a command line ends
    if (const auto argument = SplitArgument(text))
      arguments[std::wstring(argument->name)].emplace_back(argument->value);
  }

  const CollectParameters collect = BuildCollectParameters(arguments);
  const std::wstring printed = PrintCollectParameters(collect);
  PROMISE(Lines(printed) == 9);  // no value can add one
  PROMISE(printed.find(L"\noutputFolder='" + collect.outputFolder + L"'\n") != std::wstring::npos);
  PROMISE(printed.find(L"\npublicKeyFile='" + collect.publicKeyFile + L"'\n") != std::wstring::npos);

  const DecryptParameters decrypt = BuildDecryptParameters(arguments);
  PROMISE(PrintDecryptParameters(decrypt) == L"\ninputFile='" + decrypt.inputFile + L"'\noutputFile='" +
                                                 decrypt.outputFile + L"'\nprivateKeyFile='" + decrypt.privateKeyFile +
                                                 L"'");

  std::wstring folder;
  const auto settings = BuildDefaultCollectingSettings(collect);
  PROMISE(settings.GetOutputFolderValue(folder) == systeminfo::OutputFolderStatus::kFound);
  PROMISE(folder == collect.outputFolder);
  PROMISE(settings.GetPrettyPrint() == collect.prettyPrint);
}
