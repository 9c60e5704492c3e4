// The outbox: a folder that takes the uploaded files where no upload service is configured, until somebody fetches
// them. A file appears under its name only when all of it is on the disk. Beside it lies "<name>.json" with the
// category, the tags, the size and the SHA-256 of the file; the file is complete without it.
#pragma once

#include <windows.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "companions/upload/upload_request.h"
#include "companions/upload/upload_source.h"

namespace qxlink {

// The configured folder for this process and this library: environment variables expanded, relative paths below
// `libraryFolder`. Empty when a variable does not exist.
std::wstring ResolveOutboxFolder(std::wstring_view configured, std::wstring_view libraryFolder);

// Makes the folder and its missing parents, each private to the current user; a folder that is there stays as it is.
DWORD CreateOutboxFolder(const std::wstring& folder);

// "<yyyymmdd-hhmmss>-<16 hexadecimal digits>-<original name>", at most 200 characters of the original name, the last
// ones, with "_" for what cannot stand in a file name.
std::wstring OutboxFileName(const SYSTEMTIME& utc, uint64_t random, std::wstring_view originalPath);

// Copies the source into the folder, which is there; `path` becomes the file's. A QxskylaneResult; failures are logged
// here.
int32_t PutIntoOutbox(const std::wstring& folder, const UploadRequest& request, UploadSource& source,
                      std::wstring& path);

// The paths of the files that lie in the folder, the oldest first; none when it does not exist. Only names as
// OutboxFileName makes them count.
std::vector<std::wstring> FilesInOutbox(const std::wstring& folder);

// The request with which a file came into the outbox, as far as its description says.
UploadRequest RequestOfOutboxFile(const std::wstring& path);

// Deletes the file, which `source` has open for itself alone, and its description.
void RemoveFromOutbox(const std::wstring& path, FileSource& source);

// Deletes what uploads left half written more than an hour ago, because their process was ended.
void DeleteAbandonedParts(const std::wstring& folder);

}  // namespace qxlink
