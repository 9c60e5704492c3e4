#include "companions/crash/kernel_file.h"

#include <winternl.h>

#include <cstring>

// Documented for drivers; not every edition of the headers for programs declares them.
// NOLINTBEGIN(readability-redundant-declaration)
extern "C" NTSTATUS NTAPI NtSetInformationFile(HANDLE file, PIO_STATUS_BLOCK status, PVOID information, ULONG length,
                                               FILE_INFORMATION_CLASS kind);
extern "C" NTSTATUS NTAPI RtlGetVersion(PRTL_OSVERSIONINFOW version);
// NOLINTEND(readability-redundant-declaration)

namespace crash {
namespace {

constexpr size_t kLongestPath = 32767;
constexpr auto kRename = static_cast<FILE_INFORMATION_CLASS>(10);

// The room for a rename; only one thread of a process comes here.
struct RenameRequest {
  FILE_RENAME_INFO information;
  wchar_t rest[kLongestPath];
};
RenameRequest g_rename;

bool Succeeded(NTSTATUS status) {
  return status >= 0;
}

}  // namespace

std::wstring KernelPath(std::wstring extendedPath) {
  if (extendedPath.starts_with(L"\\\\?\\")) extendedPath[1] = L'?';
  return extendedPath;
}

KernelFile::KernelFile(const wchar_t* path) noexcept {
  UNICODE_STRING name;
  RtlInitUnicodeString(&name, path);
  OBJECT_ATTRIBUTES attributes;
  InitializeObjectAttributes(&attributes, &name, OBJ_CASE_INSENSITIVE, nullptr, nullptr);
  IO_STATUS_BLOCK status;
  HANDLE file = nullptr;
  if (Succeeded(NtCreateFile(&file, FILE_GENERIC_WRITE | DELETE, &attributes, &status, nullptr, FILE_ATTRIBUTE_NORMAL,
                             0, FILE_OVERWRITE_IF, FILE_SYNCHRONOUS_IO_NONALERT | FILE_NON_DIRECTORY_FILE, nullptr,
                             0))) {
    m_file.Reset(file);
  }
}

bool KernelFile::Write(std::span<const std::byte> bytes) noexcept {
  DWORD written = 0;
  const auto size = static_cast<DWORD>(bytes.size());
  return WriteFile(m_file.Get(), bytes.data(), size, &written, nullptr) && written == size;
}

bool KernelFile::Rename(const wchar_t* path) noexcept {
  const size_t length = std::wcslen(path);
  if (length > kLongestPath) return false;
  g_rename.information.ReplaceIfExists = TRUE;
  g_rename.information.FileNameLength = static_cast<DWORD>(length * sizeof(wchar_t));
  std::memcpy(&g_rename.information.FileName[0], path, g_rename.information.FileNameLength);
  IO_STATUS_BLOCK status;
  return Succeeded(NtSetInformationFile(m_file.Get(), &status, &g_rename, sizeof g_rename, kRename));
}

OSVERSIONINFOW SystemVersion() {
  OSVERSIONINFOW version{};
  version.dwOSVersionInfoSize = sizeof version;
  RtlGetVersion(&version);
  return version;
}

}  // namespace crash
