#include "companions/upload/sha256.h"

#include "companions/upload/hex.h"

namespace qxlink {
namespace {

bool Succeeded(NTSTATUS status) {
  return status >= 0;
}

}  // namespace

Sha256::Sha256() {
  m_isGood = Succeeded(BCryptOpenAlgorithmProvider(m_algorithm.Receive(), BCRYPT_SHA256_ALGORITHM, nullptr, 0)) &&
             Succeeded(BCryptCreateHash(m_algorithm.Get(), m_hash.Receive(), nullptr, 0, nullptr, 0, 0));
}

void Sha256::Add(std::string_view bytes) {
  // The interface is not const-correct: the bytes are only read.
  auto* const data = reinterpret_cast<PUCHAR>(const_cast<char*>(bytes.data()));
  m_isGood = m_isGood && Succeeded(BCryptHashData(m_hash.Get(), data, static_cast<ULONG>(bytes.size()), 0));
}

std::string Sha256::Finish() {
  unsigned char digest[32] = {};
  if (!m_isGood || !Succeeded(BCryptFinishHash(m_hash.Get(), digest, sizeof digest, 0))) return {};
  return HexText(digest);
}

}  // namespace qxlink
