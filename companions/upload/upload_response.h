// A QxskylaneResponse with the memory that it points to.
#pragma once

#include <memory>
#include <string>

#include "companions/upload/tus_upload.h"
#include "interfaces/qxlink_api.h"

namespace qxlink {

// Derives, so that the pointer which a caller gives back is the object's own.
class UploadResponse : public QxskylaneResponse {
 public:
  explicit UploadResponse(UploadAnswer answer) : QxskylaneResponse{}, m_answer(std::move(answer)) {
    size = sizeof(QxskylaneResponse);
    http_status = m_answer.status;
    location = m_answer.location.empty() ? nullptr : m_answer.location.c_str();
    body = m_answer.body.c_str();
    body_size = m_answer.body.size();
  }
  UploadResponse(const UploadResponse&) = delete;
  UploadResponse& operator=(const UploadResponse&) = delete;

 private:
  const UploadAnswer m_answer;
};

}  // namespace qxlink
