#include <windows.h>

#include <exception>
#include <string>
#include <string_view>

#include "app/collection_driver.h"
#include "core/files.h"
#include "core/logging.h"
#include "core/scope_trace.h"
#include "stutil/package.h"

namespace st {
namespace {

constexpr wchar_t kScope[] = L"st::DecryptData";
constexpr uint64_t kLargestKeyFile = uint64_t{64} << 10;
// Archives hold at most 50 MiB of content; the rest is room for names.
constexpr uint64_t kLargestPackage = uint64_t{1} << 30;

bool ReadInput(const std::wstring& path, uint64_t limit, std::string& bytes) {
  const DWORD error = ReadWholeFile(path, limit, bytes);
  if (error != ERROR_SUCCESS) LOG_ERROR(kScope, L"cannot read %s, error %u", path.c_str(), error);
  return error == ERROR_SUCCESS;
}

bool OpenPackage(const DecryptParameters& parameters) {
  std::string key;
  std::string package;
  if (!ReadInput(parameters.privateKeyFile, kLargestKeyFile, key) ||
      !ReadInput(parameters.inputFile, kLargestPackage, package)) {
    return false;
  }
  std::string archive;
  if (const DWORD error = stutil::DecryptBuffer(key, package, archive)) {
    LOG_ERROR(kScope, L"Decryption failed with code %d", error);
    return false;
  }
  const DWORD error = WriteWholeFile(parameters.outputFile, std::string_view(archive), FileRights::kPrivate);
  if (error != ERROR_SUCCESS) LOG_ERROR(kScope, L"cannot write %s, error %u", parameters.outputFile.c_str(), error);
  return error == ERROR_SUCCESS;
}

}  // namespace

bool DecryptData(const DecryptParameters& parameters) {
  const logging::ScopeTrace trace(kScope);
  try {
    return OpenPackage(parameters);
  } catch (const std::exception& exception) {  // out of memory
    LOG_ERROR(kScope, L"the package cannot be opened: %S", exception.what());
  }
  return false;
}

}  // namespace st
