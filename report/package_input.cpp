#include "report/package_input.h"

#include "core/files.h"
#include "core/text.h"
#include "stutil/package.h"
#include "stutil/package_format.h"

namespace report {
namespace {

std::string CannotRead(const std::wstring& path, DWORD error) {
  std::string message = ToUtf8(path) + " cannot be read, error " + std::to_string(error);
  if (error == ERROR_FILE_TOO_LARGE) message += ": it is too large";
  return message + ".";
}

}  // namespace

InputKind KindOfInput(std::string_view bytes) {
  using namespace std::string_view_literals;
  if (bytes.starts_with("PK\x03\x04"sv) || bytes.starts_with("PK\x05\x06"sv)) return InputKind::kArchive;
  // What every wrapped session key begins with: a SIMPLEBLOB that holds an RC4 key wrapped with RSA.
  constexpr std::string_view kBlobHeader = "\x01\x02\x00\x00\x01\x68\x00\x00\x00\xA4\x00\x00"sv;
  const auto parts = stutil::SplitPackage(bytes);
  return parts && parts->keyBlob.starts_with(kBlobHeader) ? InputKind::kPackage : InputKind::kUnknown;
}

ExitCode ReadArchiveBytes(const std::wstring& inputFile, const std::wstring& keyFile, ArchiveInput& input,
                          std::string& message) {
  std::string bytes;
  if (const DWORD error = ReadWholeFile(inputFile, kLargestInput, bytes); error != ERROR_SUCCESS) {
    message = CannotRead(inputFile, error);
    return ExitCode::kBadInput;
  }
  input.fileSize = bytes.size();
  const InputKind kind = KindOfInput(bytes);
  if (kind == InputKind::kArchive) {
    input.archive = std::move(bytes);
    return ExitCode::kNothingFound;
  }
  if (kind == InputKind::kUnknown) {
    message = ToUtf8(inputFile) + " is neither a package nor a zip archive. Was it received completely?";
    return ExitCode::kBadInput;
  }
  if (keyFile.empty()) {
    message = ToUtf8(inputFile) + " is an encrypted package. Name the private key with --key FILE.";
    return ExitCode::kBadInput;
  }
  std::string key;
  if (const DWORD error = ReadWholeFile(keyFile, kLargestKeyFile, key); error != ERROR_SUCCESS) {
    message = CannotRead(keyFile, error);
    return ExitCode::kBadInput;
  }
  if (const DWORD error = stutil::DecryptBuffer(key, bytes, input.archive); error != ERROR_SUCCESS) {
    message = ToUtf8(keyFile) + " does not open the package, error " + std::to_string(error) +
              ". Name the private key (PEM, \"RSA PRIVATE KEY\") of the pair whose public key the support tool was "
              "built with.";
    return ExitCode::kWrongKey;
  }
  if (KindOfInput(input.archive) != InputKind::kArchive) {
    message = ToUtf8(inputFile) + " is damaged: what it holds is no zip archive. Ask for it again.";
    return ExitCode::kBadInput;
  }
  return ExitCode::kNothingFound;
}

}  // namespace report
