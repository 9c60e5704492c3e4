#include "companions/upload/upload_context.h"

#include <algorithm>
#include <cstring>

#include "core/files.h"
#include "core/paths.h"
#include "core/text.h"

namespace qxlink {
namespace {

constexpr wchar_t kConfigureScope[] = L"qxlink::Configure";
constexpr wchar_t kUploadScope[] = L"qxlink::Upload";
constexpr uint64_t kLongestConfiguration = 64 << 10;

class FileSource : public UploadSource {
 public:
  DWORD Open(const std::wstring& path) {
    m_file.Reset(CreateFileW(ExtendedPath(path).c_str(), GENERIC_READ, FILE_SHARE_READ, nullptr, OPEN_EXISTING,
                             FILE_FLAG_SEQUENTIAL_SCAN, nullptr));
    LARGE_INTEGER size{};
    if (!m_file || !GetFileSizeEx(m_file.Get(), &size)) return GetLastError();
    m_size = static_cast<uint64_t>(size.QuadPart);
    return ERROR_SUCCESS;
  }

  uint64_t Size() const override { return m_size; }

  DWORD Read(std::span<char> buffer, size_t& count) override {
    DWORD read = 0;
    if (!ReadFile(m_file.Get(), buffer.data(), static_cast<DWORD>(buffer.size()), &read, nullptr))
      return GetLastError();
    count = read;
    return ERROR_SUCCESS;
  }

 private:
  KernelHandle m_file;
  uint64_t m_size = 0;
};

class MemorySource : public UploadSource {
 public:
  explicit MemorySource(std::string_view bytes) : m_size(bytes.size()), m_rest(bytes) {}

  uint64_t Size() const override { return m_size; }

  DWORD Read(std::span<char> buffer, size_t& count) override {
    count = m_rest.copy(buffer.data(), buffer.size());
    m_rest.remove_prefix(count);
    return ERROR_SUCCESS;
  }

 private:
  const uint64_t m_size;
  std::string_view m_rest;
};

}  // namespace
}  // namespace qxlink

using namespace qxlink;

int32_t QxskylaneContext::Configure(const std::wstring& libraryFolder) {
  m_libraryFolder = libraryFolder;
  std::string json;
  const DWORD error = ReadWholeFile(libraryFolder + L"\\qxlink.json", kLongestConfiguration, json);
  if (error == ERROR_FILE_NOT_FOUND) {
    LOG_INFO(kConfigureScope, L"there is no qxlink.json, files go into the default outbox");
    json = "{}";
  } else if (error != ERROR_SUCCESS) {
    LOG_ERROR(kConfigureScope, L"qxlink.json cannot be read, error %u", error);
    return QXSKYLANE_CONFIGURATION_INVALID;
  }
  const ParsedUploadConfig parsed = ParseUploadConfig(json);
  for (const std::string& name : parsed.unknownMembers) {
    LOG_WARNING(kConfigureScope, L"qxlink.json: \"%s\" is not known", ToWide(name).c_str());
  }
  for (const std::string& problem : parsed.problems) {
    LOG_ERROR(kConfigureScope, L"qxlink.json: %s", ToWide(problem).c_str());
  }
  if (!parsed.problems.empty()) return QXSKYLANE_CONFIGURATION_INVALID;
  m_config = parsed.config;
  m_outbox = m_config.outbox;
  return QXSKYLANE_OK;
}

int32_t QxskylaneContext::SetOption(int32_t option, int64_t value) {
  if (option != QXSKYLANE_OPTION_PLAIN_HTTP) return QXSKYLANE_OPTION_UNKNOWN;
  if (value != 0 && value != 1) return QXSKYLANE_BAD_ARGUMENT;
  if (value == 1 && !m_config.allowPlainHttp) {
    LOG_WARNING(L"qxlink::SetOption", L"plain HTTP is not allowed by qxlink.json");
    return QXSKYLANE_OPTION_REFUSED;
  }
  const std::lock_guard lock(m_optionMutex);
  m_usePlainHttp = value == 1;
  return QXSKYLANE_OK;
}

int32_t QxskylaneContext::SetOption(int32_t option, std::string_view text) {
  if (option != QXSKYLANE_OPTION_OUTBOX) return QXSKYLANE_OPTION_UNKNOWN;
  if (text.empty() || text.find('\0') != std::string_view::npos) return QXSKYLANE_BAD_ARGUMENT;
  const std::lock_guard lock(m_optionMutex);
  m_outbox = text;
  return QXSKYLANE_OK;
}

int32_t QxskylaneContext::GetOption(int32_t option, int64_t& value) {
  if (option != QXSKYLANE_OPTION_PLAIN_HTTP) return QXSKYLANE_OPTION_UNKNOWN;
  const std::lock_guard lock(m_optionMutex);
  value = m_usePlainHttp ? 1 : 0;
  return QXSKYLANE_OK;
}

int32_t QxskylaneContext::UploadFile(const UploadRequest& request) {
  FileSource source;
  if (const DWORD error = source.Open(ToWide(request.filePath)); error != ERROR_SUCCESS) {
    LOG_ERROR(kUploadScope, L"the file to upload cannot be opened, error %u", error);
    return QXSKYLANE_FILE_UNREADABLE;
  }
  return Upload(request, source);
}

int32_t QxskylaneContext::UploadMemory(const UploadRequest& request, std::string_view bytes) {
  MemorySource source(bytes);
  return Upload(request, source);
}

int32_t QxskylaneContext::Upload(const UploadRequest& request, UploadSource& source) {
  if (!m_config.endpoint.empty()) {
    LOG_ERROR(kUploadScope,
              L"uploading to a service is not supported yet, the file was NOT uploaded; "
              L"remove \"endpoint\" from qxlink.json to use the outbox");
    return QXSKYLANE_NOT_SUPPORTED;
  }
  std::string outbox;
  {
    const std::lock_guard lock(m_optionMutex);
    outbox = m_outbox;
  }
  const std::wstring folder = ResolveOutboxFolder(ToWide(outbox), m_libraryFolder);
  if (folder.empty()) {
    LOG_ERROR(kUploadScope, L"the outbox folder names an environment variable that does not exist");
    return QXSKYLANE_CONFIGURATION_INVALID;
  }
  if (const DWORD error = CreateOutboxFolder(folder); error != ERROR_SUCCESS) {
    LOG_ERROR(kUploadScope, L"the outbox folder cannot be made, error %u", error);
    return QXSKYLANE_OUTBOX_UNWRITABLE;
  }
  return PutIntoOutbox(folder, request, source);
}
