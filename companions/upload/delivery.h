// Brings files to where the configuration says: to the upload service, with the outbox behind it for what could not be
// sent, or into the outbox where there is no service.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>

#include "companions/upload/cancel_signal.h"
#include "companions/upload/http_client.h"
#include "companions/upload/tus_upload.h"
#include "companions/upload/upload_config.h"
#include "companions/upload/upload_request.h"
#include "companions/upload/upload_source.h"
#include "core/lock.h"

namespace qxlink {

// What the caller's options say at the beginning of an upload.
struct DeliveryOptions {
  bool usePlainHttp = false;
  std::string outbox;  // as in the configuration
};

// Its functions may run on several threads at once; they return a QxskylaneResult, and log what failed.
class Delivery {
 public:
  // `config` and `cancel` must outlive this object.
  Delivery(const UploadConfig& config, std::wstring libraryFolder, const CancelSignal& cancel);

  int32_t Upload(const UploadRequest& request, UploadSource& source, const DeliveryOptions& options,
                 UploadAnswer& answer);

  // One short message: `contentType` says what `bytes` are.
  int32_t Tell(std::string_view topic, const char* contentType, std::string_view bytes, bool usePlainHttp,
               UploadAnswer& answer);

 private:
  struct Service {
    HttpAddress address;
    ServerTrust trust;
    bool checksTrust = false;
  };

  int32_t Reach(const std::string& address, bool usePlainHttp, Service& service) const;
  int32_t Send(const UploadRequest& request, UploadSource& source, bool usePlainHttp, UploadAnswer& answer,
               std::string& sha256) const;
  int32_t OpenOutbox(const std::string& configured, std::wstring& folder) const;
  int32_t Put(const std::string& outbox, const UploadRequest& request, UploadSource& source, std::wstring& path) const;
  void SendWaiting(const UploadRequest& request, const DeliveryOptions& options);
  void Keep(const UploadRequest& request, UploadSource& source, const DeliveryOptions& options,
            const std::string& sha256);
  void Forget(const std::string& sha256);

  const UploadConfig& m_config;
  const std::wstring m_libraryFolder;
  const CancelSignal& m_cancel;
  SharedLock m_mutex;
  bool m_hasSentWaiting = false;               // guarded by m_mutex
  std::map<std::string, std::wstring> m_kept;  // what this object put into the outbox, by hash; guarded by m_mutex
};

}  // namespace qxlink
