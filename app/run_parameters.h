// The plain records that carry a run: what to collect into and what to do with it, or which package to open. Built from
// the command line over process-wide defaults. Paths are as given, relative ones against the current directory.
#pragma once

#include <string>

#include "app/command_line.h"
#include "systeminfo/collecting_settings.h"

struct CollectParameters {
  std::wstring settingsFile = L"stsettings.json";
  std::wstring outputFolder = L"collected";
  std::wstring publicKeyFile = L"publicKey.pem";  // printed only: the built-in key encrypts
  bool compress = true;                           // printed only: the archive is always written
  bool encrypt = true;
  bool prettyPrint = false;
  bool deleteTemporaryFolder = true;
  bool deleteArchive = true;
  bool cloudSubmit = true;

  bool operator==(const CollectParameters&) const = default;
};

struct DecryptParameters {
  std::wstring inputFile = L"collected.zip";
  std::wstring outputFile = L"collected_decrypted.zip";
  std::wstring privateKeyFile = L"privateKey.pem";

  bool operator==(const DecryptParameters&) const = default;
};

extern const CollectParameters kDefaultCollectParameters;
extern const DecryptParameters kDefaultDecryptParameters;

// Both log the finished record at info level.
CollectParameters BuildCollectParameters(const ArgumentMap& arguments);
DecryptParameters BuildDecryptParameters(const ArgumentMap& arguments);

std::wstring PrintCollectParameters(const CollectParameters& parameters);
std::wstring PrintDecryptParameters(const DecryptParameters& parameters);

// The settings of a run without a settings file: the parameters' folder and layout, and seven collectors.
systeminfo::CollectingSettings BuildDefaultCollectingSettings(const CollectParameters& parameters);
