// One context of the library: its configuration, its options, and what its functions do.
#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

#include "companions/upload/outbox.h"
#include "companions/upload/upload_config.h"
#include "core/logging.h"
#include "interfaces/qxlink_api.h"

// The type that the interface leaves open. Members return a QxskylaneResult and may run on several threads at once.
struct QxskylaneContext {
 public:
  // Reads qxlink.json in the library's folder; without the file the defaults hold. First, and once.
  int32_t Configure(const std::wstring& libraryFolder);

  int32_t SetOption(int32_t option, int64_t value);
  int32_t SetOption(int32_t option, std::string_view text);
  int32_t GetOption(int32_t option, int64_t& value);

  int32_t UploadFile(const qxlink::UploadRequest& request);
  int32_t UploadMemory(const qxlink::UploadRequest& request, std::string_view bytes);

 private:
  int32_t Upload(const qxlink::UploadRequest& request, qxlink::UploadSource& source);

  const std::shared_ptr<logging::CLogDLL> m_log = logging::CLogDLL::Get();
  std::wstring m_libraryFolder;
  qxlink::UploadConfig m_config;
  std::mutex m_optionMutex;
  bool m_usePlainHttp = false;  // guarded by m_optionMutex
  std::string m_outbox;         // guarded by m_optionMutex
};
