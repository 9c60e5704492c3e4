#include "systeminfo/file_reference.h"

#include <windows.h>

#include "core/files.h"
#include "core/logging.h"

namespace systeminfo {
namespace {

constexpr DWORD kShareAll = FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE;

// Local drives only: a network drive that does not answer would hold up the collection.
bool IsLocalDrive(const wchar_t* root) {
  const UINT type = GetDriveTypeW(root);
  return type == DRIVE_FIXED || type == DRIVE_REMOVABLE;
}

// The root ("C:\") of the drive with that volume; empty when there is none.
std::wstring DriveOf(uint32_t volumeSerialNumber) {
  wchar_t roots[26 * 4 + 1] = {};  // "A:\" to "Z:\", each terminated, and the end
  const DWORD length = GetLogicalDriveStringsW(static_cast<DWORD>(std::size(roots)) - 1, roots);
  if (length >= std::size(roots)) return {};
  for (const wchar_t* root = roots; *root != L'\0'; root += std::wstring_view(root).size() + 1) {
    DWORD serial = 0;
    if (IsLocalDrive(root) && GetVolumeInformationW(root, nullptr, 0, &serial, nullptr, nullptr, nullptr, 0) &&
        serial == volumeSerialNumber) {
      return root;
    }
  }
  return {};
}

}  // namespace

const KernelHandle& FileReferences::RootOf(uint32_t volumeSerialNumber) {
  const auto [entry, isNew] = m_roots.try_emplace(volumeSerialNumber);
  if (!isNew) return entry->second;
  const std::wstring root = DriveOf(volumeSerialNumber);
  if (!root.empty()) {
    entry->second.Reset(CreateFileW(ExtendedPath(root).c_str(), FILE_READ_ATTRIBUTES, kShareAll, nullptr, OPEN_EXISTING,
                                    FILE_FLAG_BACKUP_SEMANTICS, nullptr));
  }
  if (!entry->second) LOG_ERROR(L"GetDataBaseInformation", L"could not find a volume for %x.", volumeSerialNumber);
  return entry->second;
}

std::optional<std::wstring> FileReferences::PathOf(uint32_t volumeSerialNumber, uint64_t fileReferenceNumber) {
  const KernelHandle& root = RootOf(volumeSerialNumber);
  if (!root) return std::nullopt;
  FILE_ID_DESCRIPTOR id{};
  id.dwSize = sizeof id;
  id.Type = FileIdType;
  id.FileId.QuadPart = static_cast<LONGLONG>(fileReferenceNumber);
  // Only its name is of interest: without rights on the content it can be opened whoever uses it. The flag is for
  // folders.
  const KernelHandle file(
      OpenFileById(root.Get(), &id, FILE_READ_ATTRIBUTES, kShareAll, nullptr, FILE_FLAG_BACKUP_SEMANTICS));
  if (!file) return std::nullopt;
  const std::wstring path = FinalPath(file.Get());
  if (path.empty()) return std::nullopt;
  return ShownPath(path);
}

}  // namespace systeminfo
