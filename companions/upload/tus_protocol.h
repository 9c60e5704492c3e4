// What the answers of a tus 1.0 server mean, decided without talking to one: what to do next, how long to wait before,
// and what an upload says about itself. No Windows header.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "companions/upload/http_text.h"
#include "interfaces/qxlink_api.h"

namespace qxlink {

enum class TusRequest {
  Capabilities,  // OPTIONS: what the server can do
  Create,        // POST: a new upload
  Offset,        // HEAD: how much of it is there
  Chunk,         // PATCH: the bytes from there on
};

enum class TusNext {
  Proceed,    // it did what was asked
  AskOffset,  // ask where the upload stands, go on from there
  BeginAnew,  // the upload is gone or spoilt: make a new one, once
  Retry,      // later
  GiveUp,
};

struct TusVerdict {
  TusNext next;
  int32_t result;      // QxskylaneResult, for when it ends here
  const char* advice;  // for the log: what somebody can do about it
};

TusVerdict JudgeStatus(TusRequest request, unsigned status);

// What the server said about itself; an answer without the headers says nothing, and then nothing is assumed.
struct TusCapabilities {
  std::string checksumAlgorithm;    // "sha256", "sha1" (as in "Upload-Checksum"), or empty: chunks have no checksum
  std::optional<uint64_t> maxSize;  // bytes of one upload
};
TusCapabilities ReadCapabilities(const HttpHeaders& headers);

// "Upload-Offset" of an answer; nothing when it is missing, no number or beyond `size`.
std::optional<uint64_t> ReadOffset(const HttpHeaders& headers, uint64_t size);

// "name value,name value" with the values in Base64.
std::string EncodeMetadata(std::string_view fileName, std::string_view category, std::string_view tagsJson,
                           std::string_view sha256);

// Milliseconds before the next attempt after `failures` in a row (1, 2, …): `base` doubled each time, at most a minute,
// of which a random part of a half is taken off, so that a hundred machines do not come back in one moment.
// `random` is any number.
uint64_t RetryDelay(unsigned failures, uint64_t base, uint64_t random);

}  // namespace qxlink
