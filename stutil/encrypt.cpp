#include <algorithm>
#include <exception>
#include <new>

#include "core/files.h"
#include "core/logging.h"
#include "stutil/package.h"
#include "stutil/package_sealer.h"
#include "stutil/package_writer.h"

namespace stutil {
namespace {

constexpr wchar_t kScope[] = L"stutil::Encrypt";
constexpr size_t kPiece = size_t{4} << 20;  // is written while the next one is encrypted

DWORD ReadArchive(const std::wstring& path, std::string& bytes) {
  try {
    return ReadWholeFile(path, MAXDWORD, bytes);
  } catch (const std::bad_alloc&) {
    return ERROR_NOT_ENOUGH_MEMORY;
  }
}

// Reads the archive and deletes it, even when it could not be read. False when there is nothing to encrypt.
bool TakeArchive(const std::wstring& path, std::string& bytes) {
  const DWORD readError = ReadArchive(path, bytes);
  if (readError != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"failed to read compressed file %s err=%d", path.c_str(), readError);
    if (!PathExists(path)) return false;
  }
  const DWORD deleteError = DeleteFileW(ExtendedPath(path).c_str()) ? ERROR_SUCCESS : GetLastError();
  if (deleteError != ERROR_SUCCESS) {
    LOG_WARNING(kScope, L"failed to remove compressed file %s err=%d", path.c_str(), deleteError);
  } else if (readError == ERROR_SUCCESS) {
    LOG_TRACE(kScope, L"compressed file was deleted after being read into memory");
  }
  return readError == ERROR_SUCCESS;
}

// Encrypts the bytes in place and writes them behind the head. The error is that of encrypting.
DWORD EncryptWhileWriting(const PackageSealer& sealer, std::string& bytes, PackageWriter& writer) {
  size_t done = 0;
  do {  // once for an empty archive too
    const size_t count = std::min(kPiece, bytes.size() - done);
    const bool isLast = done + count == bytes.size();
    const DWORD error = sealer.EncryptInPlace(bytes.data() + done, count, isLast);
    if (error != ERROR_SUCCESS) return error;
    done += count;
    writer.SetReady(done);
  } while (done < bytes.size());
  return ERROR_SUCCESS;
}

DWORD ReplaceByPackage(const std::wstring& path, std::string_view publicKeyPem, std::string& bytes) {
  PackageSealer sealer;
  std::string head;
  if (const DWORD error = sealer.Begin(publicKeyPem, head); error != ERROR_SUCCESS) return error;
  PackageWriter writer(path, head, bytes);
  if (const DWORD error = EncryptWhileWriting(sealer, bytes, writer); error != ERROR_SUCCESS) return error;
  LOG_TRACE(kScope, L"writing encrypted buffer to file");
  if (const DWORD error = writer.Finish(); error != ERROR_SUCCESS) {
    LOG_ERROR(kScope, L"failed to write package %s err=%d", path.c_str(), error);
  } else {
    LOG_TRACE(kScope, L"<- encrypt");
  }
  return ERROR_SUCCESS;
}

}  // namespace

void Encrypt(const std::wstring& archivePath) {
  Encrypt(archivePath, GetBuiltInPublicKey());
}

void Encrypt(const std::wstring& archivePath, std::string_view publicKeyPem) {
  LOG_TRACE(kScope, L"-> encrypt");
  std::string bytes;
  if (!TakeArchive(archivePath, bytes)) return;
  DWORD error = ERROR_NOT_ENOUGH_MEMORY;
  try {
    error = ReplaceByPackage(archivePath, publicKeyPem, bytes);
  } catch (const std::exception&) {  // no memory or no thread: the error stays
  }
  if (error != ERROR_SUCCESS) LOG_ERROR(kScope, L"Encrypt failed with %d", error);
}

}  // namespace stutil
