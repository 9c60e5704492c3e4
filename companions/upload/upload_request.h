// A caller's QxskylaneUpload, checked and copied, so that nothing behind this point looks at foreign memory again.
#pragma once

#include <json/value.h>

#include <cstdint>
#include <string>

#include "interfaces/qxlink_api.h"

namespace qxlink {

struct UploadRequest {
  std::string filePath;
  std::string category;
  Json::Value tags;  // an object, or null
  QxskylaneProgress progress = nullptr;
  void* user = nullptr;
};

// A QxskylaneResult.
int32_t ReadUploadRequest(const QxskylaneUpload* upload, UploadRequest& request);

}  // namespace qxlink
