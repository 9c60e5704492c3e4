#include "companions/upload/outbox.h"

#include <algorithm>
#include <vector>

#include "core/hex.h"
#include "core/digest.h"
#include "core/files.h"
#include "core/format.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/text.h"

namespace qxlink {
namespace {

constexpr wchar_t kScope[] = L"qxlink::PutIntoOutbox";
constexpr size_t kBufferSize = size_t{1} << 20;
constexpr size_t kLongestOriginalName = 200;
constexpr ULONGLONG kProgressInterval = 100;  // milliseconds

bool RandomNumber(uint64_t& number) {
  return BCryptGenRandom(nullptr, reinterpret_cast<PUCHAR>(&number), sizeof number, BCRYPT_USE_SYSTEM_PREFERRED_RNG) >=
         0;
}

// Calls the caller's progress function, but not too often. False when the caller wants no more.
class ProgressReport {
 public:
  ProgressReport(const UploadRequest& request, uint64_t total) : m_request(request), m_total(total) {}

  bool Sent(uint64_t sent, bool isEnd) {
    if (m_request.progress == nullptr) return true;
    const ULONGLONG now = GetTickCount64();
    if (!isEnd && now - m_last < kProgressInterval) return true;
    m_last = now;
    return m_request.progress(m_request.user, sent, std::max(sent, m_total)) == 0;
  }

 private:
  const UploadRequest& m_request;
  const uint64_t m_total;
  ULONGLONG m_last = 0;
};

struct CopyTotals {
  uint64_t size = 0;
  std::string sha256;
};

int32_t CopyIntoFile(const UploadRequest& request, UploadSource& source, PartialFile& file, CopyTotals& totals) {
  std::vector<char> buffer(kBufferSize);
  ProgressReport progress(request, source.Size());
  Digest hash(BCRYPT_SHA256_ALGORITHM);
  for (;;) {
    size_t count = 0;
    if (const DWORD error = source.Read(buffer, count); error != ERROR_SUCCESS) {
      LOG_ERROR(kScope, L"the file to upload cannot be read, error %u", error);
      return QXSKYLANE_FILE_UNREADABLE;
    }
    const std::string_view bytes(buffer.data(), count);
    if (const DWORD error = file.Write(bytes); error != ERROR_SUCCESS) {
      LOG_ERROR(kScope, L"the outbox cannot be written to, error %u", error);
      return QXSKYLANE_OUTBOX_UNWRITABLE;
    }
    hash.Add(bytes);
    totals.size += count;
    if (!progress.Sent(totals.size, count == 0)) return QXSKYLANE_CANCELLED;
    if (count == 0) break;
  }
  totals.sha256 = hash.Finish();
  return QXSKYLANE_OK;
}

// What is known of the file beyond its bytes. Not having it is no reason to call the upload failed.
void WriteDescription(const std::wstring& path, const UploadRequest& request, const CopyTotals& totals) {
  Json::Value description(Json::objectValue);
  description["category"] = request.category;
  description["size"] = static_cast<Json::UInt64>(totals.size);
  if (!totals.sha256.empty()) description["sha256"] = totals.sha256;
  if (!request.tags.isNull()) description["tags"] = request.tags;
  const DWORD error = WriteWholeFile(path + L".json", WriteStyledJson(description));
  if (error != ERROR_SUCCESS) LOG_WARNING(kScope, L"the description of the file cannot be written, error %u", error);
}

}  // namespace

std::wstring ResolveOutboxFolder(std::wstring_view configured, std::wstring_view libraryFolder) {
  const std::wstring text(configured);
  std::wstring folder(ExpandEnvironmentStringsW(text.c_str(), nullptr, 0), L'\0');
  const DWORD length = ExpandEnvironmentStringsW(text.c_str(), folder.data(), static_cast<DWORD>(folder.size()));
  if (length == 0 || length > folder.size()) return {};
  folder.resize(length - 1);
  // A variable that does not exist stays as it is; a folder named "%LOCALAPPDATA%" is not what anybody means.
  const size_t percent = folder.find(L'%');
  if (percent != std::wstring::npos && folder.find(L'%', percent + 1) != std::wstring::npos) return {};
  const bool isRooted = folder.starts_with(L'\\') || folder.starts_with(L'/') || folder.find(L':') == 1;
  return ExtendedPath(isRooted ? folder : std::wstring(JoinPath(libraryFolder, folder)));
}

DWORD CreateOutboxFolder(const std::wstring& folder) {
  DWORD error = CreatePrivateFolder(folder);
  if (error == ERROR_PATH_NOT_FOUND) {
    const size_t end = folder.find_last_of(L'\\');
    if (end == std::wstring::npos || end == 0) return error;
    error = CreateOutboxFolder(folder.substr(0, end));
    if (error == ERROR_SUCCESS) error = CreatePrivateFolder(folder);
  }
  return error != ERROR_SUCCESS && FolderExists(folder) ? ERROR_SUCCESS : error;
}

std::wstring OutboxFileName(const SYSTEMTIME& utc, uint64_t random, std::wstring_view originalPath) {
  std::wstring original(LastPathComponent(originalPath));
  if (original.size() > kLongestOriginalName) {
    original.erase(0, original.size() - kLongestOriginalName);
    if (IS_LOW_SURROGATE(original.front())) original.erase(0, 1);
  }
  constexpr std::wstring_view kForbidden = L"<>:\"/\\|?*";
  for (wchar_t& c : original) {
    if (c < L' ' || kForbidden.find(c) != std::wstring_view::npos) c = L'_';
  }
  while (original.ends_with(L'.') || original.ends_with(L' '))
    original.pop_back();
  return Format(L"%04u%02u%02u-%02u%02u%02u-%016llx-%s", utc.wYear, utc.wMonth, utc.wDay, utc.wHour, utc.wMinute,
                utc.wSecond, random, original.empty() ? L"upload" : original.c_str());
}

int32_t PutIntoOutbox(const std::wstring& folder, const UploadRequest& request, UploadSource& source) {
  uint64_t random = 0;
  if (!RandomNumber(random)) {
    LOG_ERROR(kScope, L"the system has no random numbers");
    return QXSKYLANE_INTERNAL_ERROR;
  }
  SYSTEMTIME now{};
  GetSystemTime(&now);
  const std::wstring path = folder + L'\\' + OutboxFileName(now, random, ToWide(request.filePath));
  PartialFile file(path);
  CopyTotals totals;
  if (const DWORD error = file.Create(); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"no file can be made in the outbox, error %u", error);
    return QXSKYLANE_OUTBOX_UNWRITABLE;
  }
  if (const int32_t result = CopyIntoFile(request, source, file, totals); result != QXSKYLANE_OK) return result;
  if (const DWORD error = file.Publish(); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"the file cannot be completed in the outbox, error %u", error);
    return QXSKYLANE_OUTBOX_UNWRITABLE;
  }
  WriteDescription(path, request, totals);
  LOG_INFO(kScope, L"%llu bytes lie in the outbox as %s", totals.size, std::wstring(LastPathComponent(path)).c_str());
  return QXSKYLANE_OK;
}

}  // namespace qxlink
