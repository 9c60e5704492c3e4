#include "companions/upload/transfer_progress.h"

#include <algorithm>

#include "core/logging.h"

namespace qxlink {
namespace {

constexpr ULONGLONG kCallInterval = 100;   // milliseconds
constexpr ULONGLONG kLineInterval = 5000;  // milliseconds

}  // namespace

TransferProgress::TransferProgress(const UploadRequest& request, uint64_t total)
    : m_request(request), m_total(total), m_lastLine(GetTickCount64()) {}

bool TransferProgress::At(uint64_t position) {
  const ULONGLONG now = GetTickCount64();
  const bool isEnd = position >= m_total;
  if (now - m_lastLine >= kLineInterval && !isEnd) {
    m_lastLine = now;
    LOG_INFO(L"qxlink::Upload", L"%llu of %llu bytes are sent (%llu %%)", position, m_total, position * 100 / m_total);
  }
  if (m_request.progress == nullptr || (!isEnd && now - m_lastCall < kCallInterval)) return true;
  m_lastCall = now;
  return m_request.progress(m_request.user, position, std::max(position, m_total)) == 0;
}

}  // namespace qxlink
