#include "companions/upload/tus_protocol.h"

#include <algorithm>
#include <array>

namespace qxlink {
namespace {

constexpr uint64_t kLongestDelay = 60'000;  // milliseconds

struct StatusRow {
  unsigned status;
  TusVerdict verdict;
};

// Whatever the request was. Other numbers are judged by their hundreds.
constexpr StatusRow kStatusTable[] = {
    {401, {TusNext::GiveUp, QXSKYLANE_SERVICE_REFUSED, "check the key in \"headers\" of qxlink.json"}},
    {403, {TusNext::GiveUp, QXSKYLANE_SERVICE_REFUSED, "check the key in \"headers\" of qxlink.json"}},
    {407,
     {TusNext::GiveUp, QXSKYLANE_SERVICE_REFUSED, "the proxy asks for a user name; check \"proxy\" of qxlink.json"}},
    {408, {TusNext::Retry, QXSKYLANE_TIMED_OUT, "the service waited too long for the request"}},
    {413,
     {TusNext::GiveUp, QXSKYLANE_SERVICE_REFUSED, "the file is larger than the service takes; lower the size limit"}},
    {423, {TusNext::Retry, QXSKYLANE_SERVICE_FAILED, "the service still holds an earlier connection"}},
    {429, {TusNext::Retry, QXSKYLANE_SERVICE_FAILED, "the service is asked too often"}},
};

bool IsExpected(TusRequest request, unsigned status) {
  switch (request) {
    case TusRequest::Create:
      return status == 201;
    case TusRequest::Chunk:
      return status == 204 || status == 200;
    default:
      return status == 200 || status == 204;
  }
}

}  // namespace

TusVerdict JudgeStatus(TusRequest request, unsigned status) {
  if (IsExpected(request, status)) return {TusNext::Proceed, QXSKYLANE_OK, ""};
  const bool isOfUpload = request == TusRequest::Offset || request == TusRequest::Chunk;
  if (isOfUpload && (status == 404 || status == 410)) {
    return {TusNext::BeginAnew, QXSKYLANE_SERVICE_REFUSED, "the service no longer knows the upload"};
  }
  // 409: another offset. 460: the checksum of the chunk does not fit.
  if (request == TusRequest::Chunk && (status == 409 || status == 460)) {
    return {TusNext::AskOffset, QXSKYLANE_SERVICE_FAILED, "the service has another part of the file"};
  }
  if (isOfUpload && status == 422) {
    return {TusNext::BeginAnew, QXSKYLANE_SERVICE_REFUSED, "what arrived was not what was promised"};
  }
  const auto row = std::find_if(std::begin(kStatusTable), std::end(kStatusTable),
                                [status](const StatusRow& candidate) { return candidate.status == status; });
  if (row != std::end(kStatusTable)) return row->verdict;
  if (status >= 500 && status <= 599) return {TusNext::Retry, QXSKYLANE_SERVICE_FAILED, "the service is out of order"};
  if (status >= 400 && status <= 499) {
    return {TusNext::GiveUp, QXSKYLANE_SERVICE_REFUSED,
            "check \"endpoint\" of qxlink.json, or ask who runs the service"};
  }
  if (status >= 300 && status <= 399) {
    return {TusNext::GiveUp, QXSKYLANE_SERVICE_FAILED,
            "redirections are not followed; put the final address into \"endpoint\" of qxlink.json"};
  }
  return {TusNext::GiveUp, QXSKYLANE_SERVICE_FAILED, "this is no tus 1.0 service; check \"endpoint\" of qxlink.json"};
}

TusCapabilities ReadCapabilities(const HttpHeaders& headers) {
  TusCapabilities capabilities;
  if (ListHolds(FindHeader(headers, "Tus-Extension").value_or(""), "checksum")) {
    const std::string offered = FindHeader(headers, "Tus-Checksum-Algorithm").value_or("");
    for (const char* algorithm : {"sha256", "sha1"}) {
      if (capabilities.checksumAlgorithm.empty() && ListHolds(offered, algorithm))
        capabilities.checksumAlgorithm = algorithm;
    }
  }
  if (const auto maxSize = FindHeader(headers, "Tus-Max-Size")) capabilities.maxSize = ParseCount(*maxSize);
  return capabilities;
}

std::optional<uint64_t> ReadOffset(const HttpHeaders& headers, uint64_t size) {
  const auto text = FindHeader(headers, "Upload-Offset");
  const auto offset = text ? ParseCount(*text) : std::nullopt;
  return offset && *offset <= size ? offset : std::nullopt;
}

std::string EncodeMetadata(std::string_view fileName, std::string_view category, std::string_view tagsJson,
                           std::string_view sha256) {
  const std::array<std::pair<std::string_view, std::string_view>, 4> entries = {
      {{"filename", fileName}, {"category", category}, {"tags", tagsJson}, {"sha256", sha256}}};
  std::string text;
  for (const auto& [name, value] : entries) {
    if (!text.empty()) text += ',';
    text.append(name).append(" ").append(Base64(value));
  }
  return text;
}

uint64_t RetryDelay(unsigned failures, uint64_t base, uint64_t random) {
  uint64_t delay = std::min(base, kLongestDelay);
  for (unsigned i = 1; i < failures && delay < kLongestDelay; ++i)
    delay = std::min(delay * 2, kLongestDelay);
  const uint64_t half = delay / 2;
  return delay - (half == 0 ? 0 : random % (half + 1));
}

}  // namespace qxlink
