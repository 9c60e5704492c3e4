// Writes a package to the disk on a thread of its own, while the rest of it is still being encrypted.
#pragma once

#include <windows.h>

#include <cstddef>
#include <string>
#include <string_view>
#include <thread>

#include "core/files.h"
#include "core/lock.h"

namespace stutil {

// Used by one thread. Without a successful Finish nothing stands under the path, and no other file stays behind.
class PackageWriter {
 public:
  // `head` is final, `body` becomes so from its beginning. Both must outlive the writer. Throws std::system_error when
  // the system has no thread to give.
  PackageWriter(std::wstring_view path, std::string_view head, std::string_view body);
  ~PackageWriter();
  PackageWriter(const PackageWriter&) = delete;
  PackageWriter& operator=(const PackageWriter&) = delete;

  // The first `count` bytes of the body will not change any more. Never less than before.
  void SetReady(size_t count);

  // Once the whole body is ready: waits for it to be on the disk and gives the file its name. A Windows error number.
  DWORD Finish();

 private:
  void Run();
  size_t WaitForMoreThan(size_t written);
  DWORD WriteBody();
  void Join();

  const std::string_view m_head;
  const std::string_view m_body;
  PartialFile m_file;
  SharedLock m_lock;
  CONDITION_VARIABLE m_changed = CONDITION_VARIABLE_INIT;
  size_t m_ready = 0;             // guarded by m_lock
  DWORD m_error = ERROR_SUCCESS;  // the thread's, until it is joined
  std::thread m_thread;           // last: it uses all of the above
};

}  // namespace stutil
