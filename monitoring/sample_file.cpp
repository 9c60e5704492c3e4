#include "monitoring/sample_file.h"

#include <charconv>
#include <cstdio>

#include "core/files.h"
#include "core/logging.h"
#include "core/own_files.h"

namespace st::monitoring {
namespace {

constexpr wchar_t kAppend[] = L"st::monitoring::SampleFile::Append";

}  // namespace

std::string SampleLine(const SYSTEMTIME& utc, double value) {
  char line[96];
  const int length = std::snprintf(line, sizeof line, "%04u-%02u-%02uT%02u:%02u:%02u.%03uZ,", utc.wYear, utc.wMonth,
                                   utc.wDay, utc.wHour, utc.wMinute, utc.wSecond, utc.wMilliseconds);
  char* const end = std::to_chars(line + length, line + sizeof line, value).ptr;
  return std::string(line, static_cast<size_t>(end - line)) + "\r\n";
}

void SampleFile::Append(const SYSTEMTIME& utc, double value) {
  const std::lock_guard lock(m_mutex);
  if (m_isOver) return;
  m_isOver = !((m_file || Open()) && Write(SampleLine(utc, value)));
}

bool SampleFile::Open() {
  // Nobody else writes: two counters whose ids differ in nothing but their case would mix their samples otherwise.
  m_file = OpenForAppending(ExtendedPath(m_path).c_str(), FILE_SHARE_READ | FILE_SHARE_DELETE);
  LARGE_INTEGER size{};
  if (!m_file || !GetFileSizeEx(m_file.Get(), &size)) {
    LOG_ERROR(kAppend, L"cannot open sample file %s, error %d", m_path.c_str(), GetLastError());
    return false;
  }
  m_size = static_cast<uint64_t>(size.QuadPart);
  return m_size != 0 || Write("time,value\r\n");
}

bool SampleFile::Write(const std::string& line) {
  if (m_size > m_mostBytes || line.size() > m_mostBytes - m_size) {
    LOG_WARNING(kAppend, L"sample file %s has reached its limit of %I64u bytes", m_path.c_str(), m_mostBytes);
    return false;
  }
  DWORD written = 0;
  const DWORD length = static_cast<DWORD>(line.size());
  if (!WriteFile(m_file.Get(), line.data(), length, &written, nullptr) || written != length) {
    LOG_ERROR(kAppend, L"cannot write sample file %s, error %d", m_path.c_str(), GetLastError());
    return false;
  }
  m_size += length;
  return true;
}

}  // namespace st::monitoring
