// What `qxlink.json` says. The parser takes bytes from outside and includes no Windows header.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace qxlink {

// Milliseconds. Each limits a wait of its kind; what is slow but never still is limited by `upload` alone.
struct UploadTimeouts {
  uint64_t connect = 30'000;    // until a line stands; TLS on it gets as long again
  uint64_t send = 120'000;      // until the network takes the next MiB
  uint64_t receive = 120'000;   // until the whole answer is there; the last one comes after the server hashed all
  uint64_t upload = 7'200'000;  // one upload with all its attempts
};

struct UploadConfig {
  // Address of the upload service. Empty: there is none, files go into the outbox.
  std::string endpoint;
  // Address of the service for short messages; empty: there is none.
  std::string messages;
  // Sent with every request, an API key for instance. Their values never reach a log.
  std::vector<std::pair<std::string, std::string>> headers;
  // A file with the certificates of the authorities that alone are trusted; as `outbox`. Empty: those that Windows
  // trusts.
  std::string caFile;
  // "system", "none", or "host:port".
  std::string proxy = "system";
  // Most bytes of one request.
  uint64_t chunkSize = uint64_t{64} << 20;
  UploadTimeouts timeouts;
  // Attempts after one that failed, in a row without anything new having arrived.
  unsigned retries = 8;
  // Before the first of them, in milliseconds; doubled each time.
  uint64_t retryDelay = 1000;
  // The outbox folder; may name environment variables as %NAME%, and may be relative to the library's folder.
  std::string outbox = "%LOCALAPPDATA%\\Quorvex\\SupportTool\\Outbox";
  // Whether a file that could not be sent is put into the outbox, and sent from there before the next one.
  bool keepInOutboxOnFailure = false;
  // Whether anything may ever go by HTTP instead of HTTPS.
  bool allowPlainHttp = false;
};

struct ParsedUploadConfig {
  UploadConfig config;                      // with defaults for whatever is not given
  std::vector<std::string> problems;        // one sentence each, fit for a log: no value of the file is repeated
  std::vector<std::string> unknownMembers;  // as "name" or "timeouts.name"; they have no effect
};

// The configuration is valid when there are no problems; with any, it must not be used.
ParsedUploadConfig ParseUploadConfig(std::string_view json);

}  // namespace qxlink
