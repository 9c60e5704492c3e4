#include "companions/log/log_file.h"

#include <algorithm>
#include <vector>

#include "companions/log/log_line.h"
#include "core/files.h"
#include "core/own_files.h"

namespace logfile {
namespace {

// A folder that cannot be written is not asked again for every line.
constexpr ULONGLONG kOpenInterval = 1000;
// How much more goes into a full file that cannot be moved (a viewer holds it) before it is tried again.
constexpr uint64_t kRotationRetryBytes = uint64_t{64} << 10;

bool EndsInLine(HANDLE file, uint64_t size) {
  if (size == 0) return true;
  OVERLAPPED position{};
  position.Offset = static_cast<DWORD>(size - 1);
  position.OffsetHigh = static_cast<DWORD>((size - 1) >> 32);
  char last = 0;
  DWORD count = 0;
  return ReadFile(file, &last, 1, &count, &position) && count == 1 && last == '\n';
}

}  // namespace

LogFile::LogFile(std::wstring folder, std::wstring program, std::wstring module)
    : m_folder(std::move(folder)), m_program(std::move(program)), m_module(std::move(module)) {}

void LogFile::SetLimits(uint64_t maxBytes, uint32_t oldFiles) {
  m_maxBytes = maxBytes;
  m_oldFiles = oldFiles;
  m_noRotationBelow = 0;
}

std::wstring LogFile::Path(unsigned number) const {
  return ExtendedPath(m_folder + L"\\" + LogFileName(m_program, m_slot, m_module, number));
}

DWORD LogFile::Append(std::string_view bytes) {
  if (!m_file) {
    if (const DWORD error = Open(); error != ERROR_SUCCESS) return error;
  }
  RotateIfNeeded(bytes.size());
  if (!m_file) {
    if (const DWORD error = Open(); error != ERROR_SUCCESS) return error;
  }
  if (!m_needsLineEnd) return WriteBytes(bytes);
  return WriteBytes("\r\n" + std::string(bytes));
}

DWORD LogFile::WriteBytes(std::string_view bytes) {
  DWORD written = 0;
  const bool done = WriteFile(m_file.Get(), bytes.data(), static_cast<DWORD>(bytes.size()), &written, nullptr) != 0;
  const DWORD error = done ? ERROR_SUCCESS : GetLastError();
  m_size += written;
  if (written == bytes.size()) {
    m_needsLineEnd = false;
    return ERROR_SUCCESS;
  }
  if (written != 0) m_needsLineEnd = bytes[written - 1] != '\n';
  // A full disk may have room again for the next line; with any other error (the drive is gone) the handle may be dead.
  if (error != ERROR_SUCCESS && error != ERROR_DISK_FULL && error != ERROR_HANDLE_DISK_FULL) m_file.Reset();
  return error != ERROR_SUCCESS ? error : ERROR_DISK_FULL;
}

DWORD LogFile::Open() {
  const ULONGLONG now = GetTickCount64();
  if (m_openError != ERROR_SUCCESS && now < m_nextOpen) return m_openError;
  m_openError = OpenAnySlot();
  m_nextOpen = now + kOpenInterval;
  return m_openError;
}

// Whether the file of this slot, which gave `error`, belongs to another instance, or to somebody else altogether. It
// need not be there any more: an instance that rotates moves it aside or deletes it at any moment.
bool LogFile::IsTaken(DWORD error) const {
  return error == ERROR_SHARING_VIOLATION || error == ERROR_ACCESS_DENIED || PathExists(Path(0));
}

DWORD LogFile::OpenAnySlot() {
  if (const DWORD error = CreateFolders(m_folder); error != ERROR_SUCCESS) return error;
  const unsigned first = m_slot;
  DWORD error = ERROR_SUCCESS;
  for (; m_slot <= kMostSlots; ++m_slot) {
    error = OpenSlot();
    if (error == ERROR_SUCCESS || !IsTaken(error)) break;
  }
  if (error != ERROR_SUCCESS) m_slot = first;
  return error;
}

DWORD LogFile::OpenSlot() {
  KernelHandle file = OpenForAppending(Path(0).c_str(), FILE_SHARE_READ);  // others neither write nor delete
  if (!file) return GetLastError();
  LARGE_INTEGER size{};
  if (!GetFileSizeEx(file.Get(), &size)) return GetLastError();
  m_file = std::move(file);
  m_size = static_cast<uint64_t>(size.QuadPart);
  m_needsLineEnd = !EndsInLine(m_file.Get(), m_size);
  return ERROR_SUCCESS;
}

void LogFile::RotateIfNeeded(uint64_t more) {
  const bool anew = m_beginAnew && m_size != 0;
  m_beginAnew = false;
  if (!anew && (m_size < m_noRotationBelow || !IsFull(m_size, more, m_maxBytes))) return;
  Rotate();
}

// Leaves the file closed for Append to open the new one; open, and growing on, when it could not be moved.
void LogFile::Rotate() {
  const bool moved = MoveAside();
  m_noRotationBelow = 0;
  m_nextOpen = 0;
  if (moved || m_file || OpenSlot() != ERROR_SUCCESS) return;
  m_noRotationBelow = m_size + kRotationRetryBytes;
}

bool LogFile::MoveAside() {
  std::vector<bool> taken;
  for (uint32_t number = 1; number <= m_oldFiles; ++number)
    taken.push_back(PathExists(Path(number)));
  // Left from a time when more were kept.
  for (uint32_t number = m_oldFiles + 1; DeleteFileW(Path(number).c_str()); ++number) {
  }
  const std::vector<Renaming> plan = PlanRotation(taken);
  for (const Renaming& renaming : plan) {
    // Up to here the open file kept other instances away from this slot. It cannot be renamed while it is open: a
    // handle that allows it would keep ordinary readers out of the log.
    if (renaming.from == 0) m_file.Reset();
    const DWORD replace = renaming.to == m_oldFiles ? MOVEFILE_REPLACE_EXISTING : 0;
    if (!MoveFileExW(Path(renaming.from).c_str(), Path(renaming.to).c_str(), replace)) {
      m_file.Reset();
      return false;
    }
  }
  if (!plan.empty()) return true;
  m_file.Reset();
  return DeleteFileW(Path(0).c_str()) != 0;
}

}  // namespace logfile
