// The outbox: a folder that takes the uploaded files where no upload service is configured, until somebody fetches
// them. A file appears under its name only when all of it is on the disk. Beside it lies "<name>.json" with the
// category, the tags, the size and the SHA-256 of the file; the file is complete without it.
#pragma once

#include <windows.h>

#include <cstdint>
#include <functional>
#include <span>
#include <string>
#include <string_view>

#include "companions/upload/upload_request.h"

namespace qxlink {

// Where the bytes of an upload come from, in order.
class UploadSource {
 public:
  virtual ~UploadSource() = default;
  virtual uint64_t Size() const = 0;
  // Fills the buffer as far as there are bytes; `count` 0 is the end. A Windows error number.
  virtual DWORD Read(std::span<char> buffer, size_t& count) = 0;
};

// The configured folder for this process and this library: environment variables expanded, relative paths below
// `libraryFolder`. Empty when a variable does not exist.
std::wstring ResolveOutboxFolder(std::wstring_view configured, std::wstring_view libraryFolder);

// Makes the folder and its missing parents, each private to the current user; a folder that is there stays as it is.
DWORD CreateOutboxFolder(const std::wstring& folder);

// "<yyyymmdd-hhmmss>-<16 hexadecimal digits>-<original name>", at most 200 characters of the original name, the last
// ones, with "_" for what cannot stand in a file name.
std::wstring OutboxFileName(const SYSTEMTIME& utc, uint64_t random, std::wstring_view originalPath);

// Copies the source into the folder, which is there. A QxskylaneResult; failures are logged here.
int32_t PutIntoOutbox(const std::wstring& folder, const UploadRequest& request, UploadSource& source);

}  // namespace qxlink
