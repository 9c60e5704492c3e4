// One log file on the disk with its old files. A file has one writer at a time, of all processes: it is opened without
// write sharing, and an instance that finds it taken goes on to the next slot ("<program>-2.log"). So lines of two
// processes never meet, no lock is shared with another process, and the system ends the claim with the process.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "core/scoped.h"

namespace logfile {

// Not safe for several threads; the owner serialises.
class LogFile {
 public:
  // `module` is empty for the program's own lines. Nothing is opened or created before the first Append.
  LogFile(std::wstring folder, std::wstring program, std::wstring module);

  // How large the file may grow (0: without limit), and how many old files are kept.
  void SetLimits(uint64_t maxBytes, uint32_t oldFiles);

  // The first Append moves a file that is there aside instead of going on behind its last line.
  void BeginAnew() { m_beginAnew = true; }

  // Writes whole lines with one call to the system, after which they outlive this process. Returns 0, or the Windows
  // error number of what failed; the bytes are then not in the file, or are followed by a line end before anything
  // else.
  DWORD Append(std::string_view bytes);

  static constexpr unsigned kMostSlots = 99;

 private:
  std::wstring Path(unsigned number) const;
  DWORD Open();
  DWORD OpenSlot();
  bool IsTaken(DWORD error) const;
  DWORD OpenAnySlot();
  void Rotate();
  bool MoveAside();
  void RotateIfNeeded(uint64_t more);
  DWORD WriteBytes(std::string_view bytes);

  const std::wstring m_folder;
  const std::wstring m_program;
  const std::wstring m_module;
  uint64_t m_maxBytes = 0;
  uint32_t m_oldFiles = 0;
  bool m_beginAnew = false;

  KernelHandle m_file;
  unsigned m_slot = 1;
  uint64_t m_size = 0;             // of the open file; nobody else writes to it
  uint64_t m_noRotationBelow = 0;  // after a rotation that failed
  bool m_needsLineEnd = false;     // the file ends in the middle of a line
  DWORD m_openError = 0;
  ULONGLONG m_nextOpen = 0;  // milliseconds of the system timer; no attempt before
};

}  // namespace logfile
