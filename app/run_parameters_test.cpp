#include "app/run_parameters.h"

#include <gtest/gtest.h>

#include "core/json.h"

TEST(CollectParameters, DefaultsArePrintedExactly) {
  EXPECT_EQ(PrintCollectParameters(BuildCollectParameters({})),
            L"\nsettingsFile='stsettings.json'\noutputFolder='collected'\npublicKeyFile='publicKey.pem'\n"
            L"compressData='true'\nencrypt='true'\nprettyPrint='false'\ndeleteTemporaryFolder='true'\n"
            L"deleteArchive='true'\ncloudSubmit='true'");
}

TEST(CollectParameters, EveryOptionReachesItsField) {
  const ArgumentMap longNames{{L"settings", {L"S"}},
                              {L"publicKey", {L"K"}},
                              {L"out", {L"O%s"}},
                              {L"nocompress", {L""}},
                              {L"noencrypt", {L""}},
                              {L"prettyPrint", {L""}},
                              {L"nodeleteTemporaryFolder", {L""}},
                              {L"nodeleteArchive", {L""}},
                              {L"nocloudSubmit", {L""}}};
  const ArgumentMap shortNames{{L"s", {L"S"}}, {L"pk", {L"K"}},   {L"o", {L"O%s"}}, {L"noz", {L""}}, {L"noe", {L""}},
                               {L"pp", {L""}}, {L"nodtf", {L""}}, {L"noda", {L""}}, {L"nocs", {L""}}};
  const std::wstring expected =
      L"\nsettingsFile='S'\noutputFolder='O%s'\npublicKeyFile='K'\ncompressData='false'\nencrypt='false'\n"
      L"prettyPrint='true'\ndeleteTemporaryFolder='false'\ndeleteArchive='false'\ncloudSubmit='false'";
  EXPECT_EQ(PrintCollectParameters(BuildCollectParameters(longNames)), expected);
  EXPECT_EQ(PrintCollectParameters(BuildCollectParameters(shortNames)), expected);
}

TEST(DecryptParameters, DefaultsAndOptionsArePrintedExactly) {
  EXPECT_EQ(PrintDecryptParameters(BuildDecryptParameters({})),
            L"\ninputFile='collected.zip'\noutputFile='collected_decrypted.zip'\nprivateKeyFile='privateKey.pem'");
  const ArgumentMap given{
      {L"i", {L"I"}}, {L"out", {L"long"}}, {L"o", {L"O"}}, {L"privateKey", {L"long"}}, {L"pk", {L"K"}}};
  EXPECT_EQ(PrintDecryptParameters(BuildDecryptParameters(given)),
            L"\ninputFile='I'\noutputFile='O'\nprivateKeyFile='K'");
}

TEST(DefaultCollectingSettings, HoldTheFolderTheLayoutAndSevenCollectors) {
  CollectParameters parameters;
  parameters.outputFolder = L"C:\\S\u00fcd";
  parameters.prettyPrint = true;
  EXPECT_EQ(
      WriteCompactJson(BuildDefaultCollectingSettings(parameters).Document()),
      "{\"installed_software\":true,\"output_folder\":\"C:\\\\S\\u00fcd\",\"pretty_print\":true,\"processor\":true,"
      "\"product_information\":true,\"services\":true,\"storage\":true,\"system_summary\":true,"
      "\"windows_events\":true}\n");
}
