// "qxlink.json".
#include "companions/upload/upload_config.h"

#include "companions/upload/http_text.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  const auto parsed = qxlink::ParseUploadConfig(bytes);
  if (!parsed.problems.empty()) return;
  const auto& config = parsed.config;
  for (const std::string& address : {config.endpoint, config.messages}) {
    if (address.empty()) continue;
    const auto taken = qxlink::ParseHttpAddress(address);
    PROMISE(taken && (taken->isSecure || config.allowPlainHttp));
  }
  PROMISE(config.chunkSize > 0 && config.chunkSize <= uint64_t{1} << 30);
  for (const auto& [name, value] : config.headers)
    PROMISE(qxlink::IsHeaderName(name) && qxlink::IsHeaderValue(value));
}
