#include "stutil/package_writer.h"

#include <mutex>

namespace stutil {
namespace {

constexpr size_t kFlushInterval = size_t{8} << 20;
constexpr size_t kAbandoned = SIZE_MAX;  // as the count that is ready

}  // namespace

PackageWriter::PackageWriter(std::wstring_view path, std::string_view head, std::string_view body)
    : m_head(head), m_body(body), m_file(path), m_thread([this] { Run(); }) {}

PackageWriter::~PackageWriter() {
  SetReady(kAbandoned);
  Join();
}

void PackageWriter::SetReady(size_t count) {
  {
    const std::lock_guard lock(m_lock);
    m_ready = count;
  }
  WakeConditionVariable(&m_changed);
}

size_t PackageWriter::WaitForMoreThan(size_t written) {
  const std::lock_guard lock(m_lock);
  while (m_ready == written)
    m_lock.Wait(m_changed);
  return m_ready;
}

DWORD PackageWriter::Finish() {
  Join();
  return m_error == ERROR_SUCCESS ? m_file.Publish() : m_error;
}

void PackageWriter::Run() {
  m_error = m_file.Create();
  if (m_error == ERROR_SUCCESS) m_error = m_file.Write(m_head);
  if (m_error == ERROR_SUCCESS) m_error = WriteBody();
}

DWORD PackageWriter::WriteBody() {
  size_t flushed = 0;
  for (size_t written = 0; written < m_body.size();) {
    const size_t ready = WaitForMoreThan(written);
    if (ready == kAbandoned) return ERROR_OPERATION_ABORTED;
    DWORD error = m_file.Write(m_body.substr(written, ready - written));
    written = ready;
    if (error == ERROR_SUCCESS && written - flushed >= kFlushInterval) {
      error = m_file.Flush();
      flushed = written;
    }
    if (error != ERROR_SUCCESS) return error;
  }
  return ERROR_SUCCESS;
}

void PackageWriter::Join() {
  if (m_thread.joinable()) m_thread.join();
}

}  // namespace stutil
