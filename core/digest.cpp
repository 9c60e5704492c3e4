#include "core/digest.h"

#include <array>

#include "core/hex.h"

namespace {

bool Succeeded(NTSTATUS status) {
  return status >= 0;
}

}  // namespace

Digest::Digest(const wchar_t* algorithm) {
  m_isGood = Succeeded(BCryptOpenAlgorithmProvider(m_algorithm.Receive(), algorithm, nullptr, 0)) && Begin();
}

bool Digest::Begin() {
  return Succeeded(BCryptCreateHash(m_algorithm.Get(), m_hash.Receive(), nullptr, 0, nullptr, 0, 0));
}

void Digest::Add(std::string_view bytes) {
  // The interface is not const-correct: the bytes are only read.
  auto* const data = reinterpret_cast<PUCHAR>(const_cast<char*>(bytes.data()));
  m_isGood = m_isGood && Succeeded(BCryptHashData(m_hash.Get(), data, static_cast<ULONG>(bytes.size()), 0));
}

std::string Digest::Finish() {
  std::array<unsigned char, 64> digest{};  // as long as the longest that there is
  DWORD length = 0;
  DWORD written = 0;
  const bool isGood = m_isGood &&
                      Succeeded(BCryptGetProperty(m_hash.Get(), BCRYPT_HASH_LENGTH, reinterpret_cast<PUCHAR>(&length),
                                                  sizeof length, &written, 0)) &&
                      length <= digest.size() && Succeeded(BCryptFinishHash(m_hash.Get(), digest.data(), length, 0));
  m_isGood = static_cast<bool>(m_algorithm) && Begin();
  return isGood ? HexText({digest.data(), length}) : std::string();
}
