// What an upload service answers: a status, then header lines.
#include "companions/upload/http_text.h"
#include "companions/upload/tus_protocol.h"
#include "tests/fuzz/fuzz.h"

namespace {

using namespace qxlink;

void CheckLocation(const HttpAddress& server, std::string_view location) {
  const auto target = ResolveLocation(server, location);
  if (!target) return;
  PROMISE(target->starts_with('/'));
  const auto again = ParseHttpAddress(AddressText(server, *target));
  PROMISE(again && again->host == server.host && again->port == server.port && again->target == *target);
}

}  // namespace

void FuzzOne(std::string_view bytes) {
  Input input(bytes);
  const auto size = input.Take<uint32_t>();
  const auto status = input.Take<uint16_t>();
  const auto request = static_cast<TusRequest>(input.Take<uint8_t>() % 4);
  const TusVerdict verdict = JudgeStatus(request, status);
  PROMISE(verdict.next != TusNext::GiveUp || verdict.result != QXSKYLANE_OK);

  const HttpHeaders headers = ParseHeaderLines(input.Rest());
  ReadCapabilities(headers);
  const auto offset = ReadOffset(headers, size);
  PROMISE(!offset || *offset <= size);
  static const HttpAddress s_server = *ParseHttpAddress("https://upload.example:8443/files/");
  CheckLocation(s_server, FindHeader(headers, "Location").value_or(""));
  CheckLocation(s_server, input.Rest());
  ParseRetryAfter(FindHeader(headers, "Retry-After").value_or(""), size);
  ParseHttpAddress(input.Rest());
  const std::string shown = LoggableText(input.Rest());
  PROMISE(shown.size() <= 200 && std::all_of(shown.begin(), shown.end(), [](char c) { return c >= ' ' && c <= '~'; }));
  for (const auto& [name, value] : headers)
    PROMISE(!IsHeaderValue(value) || value.find_first_of("\r\n") == std::string::npos);
}
