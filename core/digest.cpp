#include "core/digest.h"

#include <array>

#include "core/hex.h"
#include "core/logging.h"

namespace {

bool Succeeded(NTSTATUS status) {
  return status >= 0;
}

}  // namespace

Digest::Digest(const wchar_t* algorithm) : m_library(L"bcrypt.dll") {
  m_isGood = Bind() && Open(algorithm) && Begin();
  if (!m_isGood) LOG_WARNING(L"Digest::Digest", L"the system cannot compute a digest by %s", algorithm);
}

bool Digest::Bind() {
  m_calls.open = m_library.Resolve<decltype(m_calls.open)>("BCryptOpenAlgorithmProvider");
  m_calls.close = m_library.Resolve<decltype(m_calls.close)>("BCryptCloseAlgorithmProvider");
  m_calls.property = m_library.Resolve<decltype(m_calls.property)>("BCryptGetProperty");
  m_calls.create = m_library.Resolve<decltype(m_calls.create)>("BCryptCreateHash");
  m_calls.add = m_library.Resolve<decltype(m_calls.add)>("BCryptHashData");
  m_calls.finish = m_library.Resolve<decltype(m_calls.finish)>("BCryptFinishHash");
  m_calls.destroy = m_library.Resolve<decltype(m_calls.destroy)>("BCryptDestroyHash");
  return m_calls.open != nullptr && m_calls.close != nullptr && m_calls.property != nullptr &&
         m_calls.create != nullptr && m_calls.add != nullptr && m_calls.finish != nullptr && m_calls.destroy != nullptr;
}

bool Digest::Open(const wchar_t* algorithm) {
  BCRYPT_ALG_HANDLE handle = nullptr;
  if (!Succeeded(m_calls.open(&handle, algorithm, nullptr, 0))) return false;
  m_algorithm.Reset({handle, m_calls.close});
  return true;
}

bool Digest::Begin() {
  BCRYPT_HASH_HANDLE handle = nullptr;
  m_hash.Reset();
  if (!Succeeded(m_calls.create(m_algorithm.Get().handle, &handle, nullptr, 0, nullptr, 0, 0))) return false;
  m_hash.Reset({handle, m_calls.destroy});
  return true;
}

void Digest::Add(std::string_view bytes) {
  // The interface is not const-correct: the bytes are only read.
  auto* const data = reinterpret_cast<PUCHAR>(const_cast<char*>(bytes.data()));
  m_isGood = m_isGood && Succeeded(m_calls.add(m_hash.Get().handle, data, static_cast<ULONG>(bytes.size()), 0));
}

std::string Digest::Finish() {
  const std::string bytes = FinishBytes();
  return HexText({reinterpret_cast<const unsigned char*>(bytes.data()), bytes.size()});
}

std::string Digest::FinishBytes() {
  std::array<unsigned char, 64> digest{};  // as long as the longest that there is
  DWORD length = 0;
  DWORD written = 0;
  const bool isGood = m_isGood &&
                      Succeeded(m_calls.property(m_hash.Get().handle, BCRYPT_HASH_LENGTH,
                                                 reinterpret_cast<PUCHAR>(&length), sizeof length, &written, 0)) &&
                      length <= digest.size() &&
                      Succeeded(m_calls.finish(m_hash.Get().handle, digest.data(), length, 0));
  m_isGood = static_cast<bool>(m_algorithm) && Begin();
  return isGood ? std::string(digest.begin(), digest.begin() + length) : std::string();
}
