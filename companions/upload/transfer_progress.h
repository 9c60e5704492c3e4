// Tells how far an upload is: to the caller's progress function, but not too often, and to the log every few seconds.
#pragma once

#include <windows.h>

#include <cstdint>

#include "companions/upload/upload_request.h"

namespace qxlink {

class TransferProgress {
 public:
  // `request` must outlive this object.
  TransferProgress(const UploadRequest& request, uint64_t total);

  // So many bytes of the file have arrived as far as is known; may be fewer than before. False when the caller wants no
  // more. The end is always told.
  bool At(uint64_t position);

 private:
  const UploadRequest& m_request;
  const uint64_t m_total;
  // Milliseconds of the system timer.
  ULONGLONG m_lastCall = 0;
  ULONGLONG m_lastLine;
};

}  // namespace qxlink
