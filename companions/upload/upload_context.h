// One context of the library: its configuration, its options, and what its functions do.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>

#include "companions/upload/cancel_signal.h"
#include "companions/upload/delivery.h"
#include "companions/upload/upload_config.h"
#include "companions/upload/upload_source.h"
#include "companions/upload/worker.h"
#include "core/lock.h"
#include "core/logging.h"
#include "interfaces/qxlink_api.h"

// The type that the interface leaves open. Members return a QxskylaneResult and may run on several threads at once.
struct QxskylaneContext {
 public:
  ~QxskylaneContext();  // cancels what is under way and waits for its callbacks

  // Reads qxlink.json in the library's folder; without the file the defaults hold. First, and once.
  int32_t Configure(const std::wstring& libraryFolder);

  int32_t SetOption(int32_t option, int64_t value);
  int32_t SetOption(int32_t option, std::string_view text);
  int32_t GetOption(int32_t option, int64_t& value);

  int32_t UploadFile(const qxlink::UploadRequest& request, qxlink::UploadAnswer& answer);
  int32_t UploadMemory(const qxlink::UploadRequest& request, std::string_view bytes, qxlink::UploadAnswer& answer);
  int32_t Tell(std::string_view topic, const char* contentType, std::string_view bytes, qxlink::UploadAnswer& answer);

  // Does the job on the thread of this context, after those before it, and then calls `done`. Throws when it cannot be
  // begun; `done` is not called then.
  void Begin(std::function<int32_t(qxlink::UploadAnswer&)> job, QxskylaneDone done, void* user);

 private:
  int32_t Upload(const qxlink::UploadRequest& request, qxlink::UploadSource& source, qxlink::UploadAnswer& answer);
  qxlink::DeliveryOptions Options();

  const std::shared_ptr<logging::CLogDLL> m_log = logging::CLogDLL::Get();
  qxlink::UploadConfig m_config;
  qxlink::CancelSignal m_cancel;
  std::unique_ptr<qxlink::Delivery> m_delivery;
  SharedLock m_optionMutex;
  qxlink::DeliveryOptions m_options;  // guarded by m_optionMutex
  qxlink::Worker m_worker;            // last: it uses the rest
};
