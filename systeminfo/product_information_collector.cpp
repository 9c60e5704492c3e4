#include "systeminfo/product_information_collector.h"

#include "core/files.h"
#include "core/logging.h"
#include "core/text.h"
#include "systeminfo/collecting_settings.h"
#include "systeminfo/product_files.h"
#include "systeminfo/product_location.h"
#include "systeminfo/product_log_folders.h"
#include "systeminfo/product_settings.h"
#include "systeminfo/scan_cache.h"

namespace systeminfo {

void ProductInformationCollector::Start(const std::shared_ptr<CollectingSettings>& settings,
                                        const std::shared_ptr<WMIWrapper>&, const std::atomic<bool>* cancel) {
  constexpr wchar_t kScope[] = L"systeminfo::ProductInformationCollector::Start";
  const std::wstring location = GetProductInstallLocation();
  if (location.empty() || !FolderExists(location)) {
    LOG_WARNING(kScope, L"No installed product was found");
    return;
  }
  std::wstring outputFolder;
  if (settings->GetOutputFolderValue(outputFolder) != OutputFolderStatus::kFound) {
    LOG_ERROR(kScope, L"ouput_folder is not set in collector %s", m_name.c_str());
    return;
  }
  LOG_TRACE(kScope, L"outputFolder %s", outputFolder.c_str());
  WriteLogFoldersConsidered(location, outputFolder);
  m_data["install_location"] = ToUtf8(location);
  m_data["file_information"] = GetProductFileInformation(location, cancel);
  m_data["last_update"] = GetLastUpdate(location);
  m_data["smart_db"] = GetDataBaseInformation(location, cancel);
}

}  // namespace systeminfo
