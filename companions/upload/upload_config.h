// What `qxlink.json` says. The parser takes bytes from outside and includes no Windows header.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace qxlink {

struct UploadConfig {
  // Address of the upload service. Empty: there is none, files go into the outbox.
  std::string endpoint;
  // The outbox folder; may name environment variables as %NAME%, and may be relative to the library's folder.
  std::string outbox = "%LOCALAPPDATA%\\Quorvex\\SupportTool\\Outbox";
  // Whether anything may ever go by HTTP instead of HTTPS.
  bool allowPlainHttp = false;
};

struct ParsedUploadConfig {
  UploadConfig config;                      // with defaults for whatever is not given
  std::vector<std::string> problems;        // one sentence each, fit for a log: no value of the file is repeated
  std::vector<std::string> unknownMembers;  // of the top level; they have no effect
};

// The configuration is valid when there are no problems; with any, it must not be used.
ParsedUploadConfig ParseUploadConfig(std::string_view json);

}  // namespace qxlink
