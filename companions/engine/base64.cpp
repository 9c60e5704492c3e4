#include "companions/engine/base64.h"

#include <windows.h>

#include <wincrypt.h>

namespace engine {

std::string ToBase64(std::string_view bytes) {
  if (bytes.empty()) return {};
  const auto* data = reinterpret_cast<const BYTE*>(bytes.data());
  const auto count = static_cast<DWORD>(bytes.size());
  constexpr DWORD kForm = CRYPT_STRING_BASE64 | CRYPT_STRING_NOCRLF;
  DWORD size = 0;
  if (!CryptBinaryToStringA(data, count, kForm, nullptr, &size)) return {};
  std::string text(size, '\0');
  if (!CryptBinaryToStringA(data, count, kForm, text.data(), &size)) return {};
  text.resize(size);  // without the terminating zero, which the first call counts
  return text;
}

std::optional<std::string> FromBase64(std::string_view text) {
  if (text.empty()) return std::string();
  const auto count = static_cast<DWORD>(text.size());
  // Never longer than its text; asking the system for the size would decode twice.
  std::string bytes(text.size(), '\0');
  auto size = static_cast<DWORD>(bytes.size());
  if (!CryptStringToBinaryA(text.data(), count, CRYPT_STRING_BASE64, reinterpret_cast<BYTE*>(bytes.data()), &size,
                            nullptr, nullptr)) {
    return {};
  }
  bytes.resize(size);
  return bytes;
}

}  // namespace engine
