#include "companions/upload/digest.h"

namespace qxlink {
namespace {

bool Succeeded(NTSTATUS status) {
  return status >= 0;
}

}  // namespace

Digest::Digest(const wchar_t* algorithm) {
  m_isGood = Succeeded(BCryptOpenAlgorithmProvider(m_algorithm.Receive(), algorithm, nullptr, 0)) &&
             Succeeded(BCryptCreateHash(m_algorithm.Get(), m_hash.Receive(), nullptr, 0, nullptr, 0, 0));
}

void Digest::Add(std::string_view bytes) {
  // The interface is not const-correct: the bytes are only read.
  auto* const data = reinterpret_cast<PUCHAR>(const_cast<char*>(bytes.data()));
  m_isGood = m_isGood && Succeeded(BCryptHashData(m_hash.Get(), data, static_cast<ULONG>(bytes.size()), 0));
}

std::string Digest::Finish() {
  DWORD length = 0;
  DWORD written = 0;
  if (!m_isGood || !Succeeded(BCryptGetProperty(m_hash.Get(), BCRYPT_HASH_LENGTH, reinterpret_cast<PUCHAR>(&length),
                                                sizeof length, &written, 0))) {
    return {};
  }
  std::string hash(length, '\0');
  const NTSTATUS status = BCryptFinishHash(m_hash.Get(), reinterpret_cast<PUCHAR>(hash.data()), length, 0);
  return Succeeded(status) ? hash : std::string();
}

}  // namespace qxlink
