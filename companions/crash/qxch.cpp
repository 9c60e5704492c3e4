// The library's door: reads the settings beside the library, prepares the folder and installs the handler.
#include <windows.h>

#include <exception>
#include <memory>
#include <mutex>
#include <new>
#include <utility>

#include "companions/crash/crash_handler.h"
#include "companions/crash/crash_settings.h"
#include "companions/crash/dump_folder.h"
#include "core/files.h"
#include "core/lock.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/program_path.h"
#include "core/text.h"
#include "interfaces/crash_handler_api.h"

namespace {

constexpr wchar_t kScope[] = L"EnableCrashHandler";
constexpr wchar_t kSettingsFile[] = L"qxch.xml";

SharedLock g_lock;

// The handler stands in memory of the library's own, not on the heap, which may be what a crash is about. It has no
// destructor that runs when the process ends.
union HandlerPlace {
  HandlerPlace() {}
  ~HandlerPlace() {}
  crash::CrashHandler handler;
};
HandlerPlace g_place;
struct Destroy {
  void operator()(crash::CrashHandler* handler) const { std::destroy_at(handler); }
};
using HandlerOwner = std::unique_ptr<crash::CrashHandler, Destroy>;
HandlerOwner g_handler;  // guarded by g_lock; when the library is freed, nobody is in here

crash::Settings ReadSettings(const std::wstring& folder) {
  constexpr uint64_t kLongestSettings = 64 << 10;
  std::string xml;
  if (const DWORD error = ReadWholeFile(folder + L"\\" + kSettingsFile, kLongestSettings, xml); error != 0) {
    LOG_WARNING(kScope, L"%s cannot be read, defaults are used: %d", kSettingsFile, error);
    return {};
  }
  crash::ParsedSettings parsed = crash::ParseSettings(xml);
  for (const std::string& problem : parsed.problems) {
    LOG_WARNING(kScope, L"%s: %s", kSettingsFile, ToWide(problem).c_str());
  }
  return parsed.settings;
}

DWORD Enable() {
  const std::lock_guard lock(g_lock);
  if (g_handler) return ERROR_SUCCESS;
  // The program's log library is used if the program has it, and is let go before this function returns.
  std::shared_ptr<logging::CLogDLL> log;
  if (GetModuleHandleW(L"log.dll") != nullptr) log = logging::CLogDLL::Get();

  const std::wstring libraryFolder = OwnModuleFolder();
  const crash::Settings settings = ReadSettings(libraryFolder);
  const std::wstring folder = ExtendPath(ExpandEnvironment(ToWide(settings.dumpPath)), libraryFolder);
  const crash::PreparedFolder prepared = crash::PrepareFolder(folder, settings.dumpCount);
  if (prepared.error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"the folder of the crash dumps, %s, cannot be used: %d", folder.c_str(), prepared.error);
  }
  HandlerOwner handler(
      std::construct_at(&g_place.handler, folder, std::wstring(LastPathComponent(ProgramPath())), prepared.surplus));
  if (const DWORD error = handler->Install(); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"the crash handler cannot be installed: %d", error);
    return error;
  }
  g_handler = std::move(handler);
  LOG_INFO(kScope, L"crash dumps go to %s, the newest %d are kept", folder.c_str(), settings.dumpCount);
  return ERROR_SUCCESS;
}

}  // namespace

int32_t EnableCrashHandler(uint32_t reserved, const void* reservedOptions, void* reservedContext) {
  if (reserved != 0 || reservedOptions != nullptr || reservedContext != nullptr) return ERROR_INVALID_PARAMETER;
  try {
    return static_cast<int32_t>(Enable());
  } catch (const std::bad_alloc&) {
    return ERROR_NOT_ENOUGH_MEMORY;
  } catch (const std::exception&) {
    return ERROR_INTERNAL_ERROR;
  }
}

BOOL WINAPI DllMain(HINSTANCE, DWORD reason, void* processEnds) {
  switch (reason) {
    case DLL_THREAD_ATTACH:
      crash::CrashHandler::ReserveStack();
      break;
    case DLL_PROCESS_DETACH:
      if (processEnds == nullptr) {
        g_handler.reset();
      } else {
        // The other threads are gone, at whatever they were doing, and the system clears up.
        [[maybe_unused]] auto* const left = g_handler.release();
      }
      break;
    default:
      break;
  }
  return TRUE;
}
