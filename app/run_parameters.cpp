#include "app/run_parameters.h"

#include "app/options.h"
#include "core/format.h"
#include "core/logging.h"
#include "core/text.h"

const CollectParameters kDefaultCollectParameters;
const DecryptParameters kDefaultDecryptParameters;

namespace {

const wchar_t* Word(bool value) {
  return value ? L"true" : L"false";
}

}  // namespace

CollectParameters BuildCollectParameters(const ArgumentMap& arguments) {
  CollectParameters parameters = kDefaultCollectParameters;
  ReadText(arguments, options::kSettings, parameters.settingsFile);
  ReadText(arguments, options::kPublicKey, parameters.publicKeyFile);
  ReadText(arguments, options::kOut, parameters.outputFolder);
  ReadSwitch(arguments, options::kCompress, parameters.compress);
  ReadSwitch(arguments, options::kEncrypt, parameters.encrypt);
  ReadSwitch(arguments, options::kPrettyPrint, parameters.prettyPrint);
  ReadSwitch(arguments, options::kDeleteTemporaryFolder, parameters.deleteTemporaryFolder);
  ReadSwitch(arguments, options::kDeleteArchive, parameters.deleteArchive);
  ReadSwitch(arguments, options::kCloudSubmit, parameters.cloudSubmit);
  LOG_INFO(L"BuildCollectParameters", L"%s", PrintCollectParameters(parameters).c_str());
  return parameters;
}

DecryptParameters BuildDecryptParameters(const ArgumentMap& arguments) {
  DecryptParameters parameters = kDefaultDecryptParameters;
  ReadText(arguments, options::kPrivateKey, parameters.privateKeyFile);
  ReadText(arguments, options::kIn, parameters.inputFile);
  ReadText(arguments, options::kOut, parameters.outputFile);
  LOG_INFO(L"BuildDecryptParameters", L"%s", PrintDecryptParameters(parameters).c_str());
  return parameters;
}

std::wstring PrintCollectParameters(const CollectParameters& parameters) {
  return Format(
      L"\nsettingsFile='%s'\noutputFolder='%s'\npublicKeyFile='%s'\ncompressData='%s'\nencrypt='%s'\n"
      L"prettyPrint='%s'\ndeleteTemporaryFolder='%s'\ndeleteArchive='%s'\ncloudSubmit='%s'",
      parameters.settingsFile.c_str(), parameters.outputFolder.c_str(), parameters.publicKeyFile.c_str(),
      Word(parameters.compress), Word(parameters.encrypt), Word(parameters.prettyPrint),
      Word(parameters.deleteTemporaryFolder), Word(parameters.deleteArchive), Word(parameters.cloudSubmit));
}

std::wstring PrintDecryptParameters(const DecryptParameters& parameters) {
  return Format(L"\ninputFile='%s'\noutputFile='%s'\nprivateKeyFile='%s'", parameters.inputFile.c_str(),
                parameters.outputFile.c_str(), parameters.privateKeyFile.c_str());
}

systeminfo::CollectingSettings BuildDefaultCollectingSettings(const CollectParameters& parameters) {
  constexpr const wchar_t* kDefaultCollectors[] = {
      L"system_summary", L"processor",          L"storage", L"product_information",
      L"windows_events", L"installed_software", L"services"};
  systeminfo::CollectingSettings settings;
  settings.SetValue(L"output_folder", ToUtf8(parameters.outputFolder));
  settings.SetValue(L"pretty_print", parameters.prettyPrint);
  for (const wchar_t* collector : kDefaultCollectors)
    settings.SetValue(collector, true);
  return settings;
}
