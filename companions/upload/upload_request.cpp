#include "companions/upload/upload_request.h"

#include "core/json.h"

namespace qxlink {

int32_t ReadUploadRequest(const QxskylaneUpload* upload, UploadRequest& request) {
  // The first version of the struct ended behind `user`; nobody can have a shorter one.
  if (upload == nullptr || upload->size < sizeof(QxskylaneUpload)) return QXSKYLANE_BAD_ARGUMENT;
  if (upload->file_path == nullptr || *upload->file_path == '\0' || upload->category == nullptr) {
    return QXSKYLANE_BAD_ARGUMENT;
  }
  request.filePath = upload->file_path;
  request.category = upload->category;
  request.progress = upload->progress;
  request.user = upload->user;
  if (upload->tags_json == nullptr) return QXSKYLANE_OK;
  std::string error;
  const bool isJson = ParseJson(upload->tags_json, request.tags, error);
  return isJson && request.tags.isObject() ? QXSKYLANE_OK : QXSKYLANE_BAD_ARGUMENT;
}

}  // namespace qxlink
