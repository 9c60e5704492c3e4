#include "companions/upload/outbox.h"

#include <set>

#include "companions/upload/transfer_progress.h"
#include "core/digest.h"
#include "core/files.h"
#include "core/format.h"
#include "core/json.h"
#include "core/logging.h"
#include "core/paths.h"
#include "core/private_access.h"
#include "core/text.h"

namespace qxlink {
namespace {

constexpr wchar_t kScope[] = L"qxlink::PutIntoOutbox";
constexpr size_t kBufferSize = size_t{1} << 20;
constexpr size_t kLongestOriginalName = 200;
constexpr uint64_t kLongestDescription = 1 << 20;
constexpr uint64_t kAbandonedAfter = uint64_t{3600} * 10'000'000;  // in units of FILETIME
constexpr std::wstring_view kDescriptionSuffix = L".json";

bool RandomNumber(uint64_t& number) {
  return BCryptGenRandom(nullptr, reinterpret_cast<PUCHAR>(&number), sizeof number, BCRYPT_USE_SYSTEM_PREFERRED_RNG) >=
         0;
}

struct CopyTotals {
  uint64_t size = 0;
  std::string sha256;
};

int32_t CopyIntoFile(const UploadRequest& request, UploadSource& source, PartialFile& file, CopyTotals& totals) {
  std::vector<char> buffer(kBufferSize);
  TransferProgress progress(request, source.Size());
  Digest hash(BCRYPT_SHA256_ALGORITHM);
  for (;;) {
    size_t count = 0;
    if (const DWORD error = source.ReadAt(totals.size, buffer, count); error != ERROR_SUCCESS) {
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
    if (!progress.At(totals.size)) return QXSKYLANE_CANCELLED;
    if (count == 0) break;
  }
  if (totals.size < source.Size()) {
    LOG_ERROR(kScope, L"the file to upload became shorter while it was read");
    return QXSKYLANE_FILE_UNREADABLE;
  }
  totals.sha256 = hash.Finish();
  return QXSKYLANE_OK;
}

// What is known of the file beyond its bytes. Not having it is no reason to call the upload failed.
void WriteDescription(const std::wstring& path, const UploadRequest& request, const CopyTotals& totals) {
  Json::Value description(Json::objectValue);
  description["category"] = request.category;
  description["size"] = static_cast<Json::UInt64>(totals.size);
  if (!totals.sha256.empty()) {
    description["sha256"] = totals.sha256;
  } else {
    LOG_WARNING(kScope, L"the system cannot compute a SHA-256");
  }
  if (!request.tags.isNull()) description["tags"] = request.tags;
  const DWORD error = WriteWholeFile(path + std::wstring(kDescriptionSuffix), WriteStyledJson(description));
  if (error != ERROR_SUCCESS) LOG_WARNING(kScope, L"the description of the file cannot be written, error %u", error);
}

// "<yyyymmdd-hhmmss>-<16 hexadecimal digits>-"
constexpr size_t kPrefixLength = 33;

bool IsOutboxName(std::wstring_view name) {
  if (name.size() <= kPrefixLength) return false;
  for (size_t i = 0; i < kPrefixLength; ++i) {
    const wchar_t c = name[i];
    const bool isDash = i == 8 || i == 15 || i == 32;
    const bool isDigit = (c >= L'0' && c <= L'9') || (i > 15 && c >= L'a' && c <= L'f');
    if (isDash ? c != L'-' : !isDigit) return false;
  }
  return true;
}

uint64_t Number(const FILETIME& time) {
  return uint64_t{time.dwHighDateTime} << 32 | time.dwLowDateTime;
}

// Calls `take` with the record of each file of the folder whose name an upload made.
template <class Function>
void ForEachOutboxFile(const std::wstring& folder, Function take) {
  WIN32_FIND_DATAW data{};
  const FindHandle find(FindFirstFileW((folder + L"\\*").c_str(), &data));
  if (!find) {
    const DWORD error = GetLastError();
    if (error != ERROR_FILE_NOT_FOUND) LOG_WARNING(kScope, L"the outbox cannot be listed, error %u", error);
    return;
  }
  do {
    if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) == 0 && IsOutboxName(data.cFileName)) take(data);
  } while (FindNextFileW(find.Get(), &data));
  const DWORD error = GetLastError();
  if (error != ERROR_NO_MORE_FILES) LOG_WARNING(kScope, L"the outbox cannot be listed to its end, error %u", error);
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

int32_t PutIntoOutbox(const std::wstring& folder, const UploadRequest& request, UploadSource& source,
                      std::wstring& path) {
  uint64_t random = 0;
  if (!RandomNumber(random)) {
    LOG_ERROR(kScope, L"the system has no random numbers");
    return QXSKYLANE_INTERNAL_ERROR;
  }
  SYSTEMTIME now{};
  GetSystemTime(&now);
  path = folder + L'\\' + OutboxFileName(now, random, ToWide(request.filePath));
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

std::vector<std::wstring> FilesInOutbox(const std::wstring& folder) {
  std::set<std::wstring> names;
  ForEachOutboxFile(folder, [&](const WIN32_FIND_DATAW& data) { names.insert(data.cFileName); });
  std::vector<std::wstring> paths;
  for (const std::wstring& name : names) {
    if (name.ends_with(kPartialSuffix)) continue;
    const bool isDescription =
        name.ends_with(kDescriptionSuffix) && names.count(name.substr(0, name.size() - kDescriptionSuffix.size())) != 0;
    if (!isDescription) paths.emplace_back(folder + L'\\').append(name);
  }
  return paths;  // their names begin with the time
}

UploadRequest RequestOfOutboxFile(const std::wstring& path) {
  UploadRequest request;
  request.filePath = ToUtf8(LastPathComponent(path).substr(kPrefixLength));
  std::string json;
  std::string problem;
  Json::Value description;
  if (ReadWholeFile(path + std::wstring(kDescriptionSuffix), kLongestDescription, json) != ERROR_SUCCESS ||
      !ParseJson(json, description, problem) || !description.isObject()) {
    LOG_WARNING(kScope, L"%s has no readable description", std::wstring(LastPathComponent(path)).c_str());
    return request;
  }
  if (description["category"].isString()) request.category = description["category"].asString();
  if (description["tags"].isObject()) request.tags = description["tags"];
  return request;
}

void RemoveFromOutbox(const std::wstring& path, FileSource& source) {
  if (const DWORD error = source.Delete(); error != ERROR_SUCCESS) {
    LOG_WARNING(kScope, L"%s was sent but cannot be deleted from the outbox, error %u",
                std::wstring(LastPathComponent(path)).c_str(), error);
    return;
  }
  DeleteFileW((path + std::wstring(kDescriptionSuffix)).c_str());
}

void DeleteAbandonedParts(const std::wstring& folder) {
  FILETIME now{};
  GetSystemTimeAsFileTime(&now);
  ForEachOutboxFile(folder, [&](const WIN32_FIND_DATAW& data) {
    const std::wstring name = data.cFileName;
    if (!name.ends_with(kPartialSuffix) || Number(data.ftLastWriteTime) + kAbandonedAfter > Number(now)) return;
    if (DeleteFileW((folder + L'\\' + name).c_str())) LOG_INFO(kScope, L"deleted %s, left half written", name.c_str());
  });
}

}  // namespace qxlink
