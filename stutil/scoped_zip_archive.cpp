#include "stutil/scoped_zip_archive.h"

#include <miniz.h>

#include <algorithm>

#include "core/logging.h"
#include "core/text.h"
#include "stutil/archive_file.h"

namespace stutil {
namespace {

constexpr uint64_t kLocalHeaderSize = 30;

// The days 1980-01-02 and 2107-12-31 in UTC: whatever the time zone, the local time has a place in a zip entry.
constexpr uint64_t kEarliestTime = 315'619'200;
constexpr uint64_t kLatestTime = 4'354'732'800;

MZ_TIME_T EntryTime(uint64_t seconds) {
  const bool isBefore1970 = seconds > uint64_t{1} << 63;  // wrapped around
  return static_cast<MZ_TIME_T>(isBefore1970 ? kEarliestTime : std::clamp(seconds, kEarliestTime, kLatestTime));
}

}  // namespace

struct ScopedZipArchive::Writer {
  ArchiveFile file;
  mz_zip_archive zip{};

  // The entry whose data is written ahead of its header.
  uint64_t aheadOffset = 0;
  uint64_t aheadSize = 0;

  ~Writer() { mz_zip_writer_end(&zip); }

  bool Open(std::wstring_view path);
  bool AddData(const ZipEntry& entry, const void* data, size_t size);
  static size_t Write(void* self, mz_uint64 offset, const void* data, size_t size);
};

bool ScopedZipArchive::Writer::Open(std::wstring_view path) {
  if (const DWORD error = file.Create(path); error != ERROR_SUCCESS) {
    SetLastError(error);
    return false;
  }
  zip.m_pWrite = &Writer::Write;
  zip.m_pIO_opaque = this;
  return mz_zip_writer_init_v2(&zip, 0, 0) != MZ_FALSE;
}

// The library hands all data through here. For an entry that was written ahead it is given, in place of the data, the
// address of `aheadOffset`, which says where the data stands already.
size_t ScopedZipArchive::Writer::Write(void* self, mz_uint64 offset, const void* data, size_t size) {
  auto& writer = *static_cast<Writer*>(self);
  if (data == &writer.aheadOffset) return offset == writer.aheadOffset && size == writer.aheadSize ? size : 0;
  return writer.file.Write(offset, data, size) ? size : 0;
}

bool ScopedZipArchive::Writer::AddData(const ZipEntry& entry, const void* data, size_t size) {
  const std::string name = ToUtf8(entry.name);
  MZ_TIME_T time = EntryTime(entry.lastWriteTime);
  const mz_uint flags = size == 0 ? 0 : MZ_ZIP_FLAG_COMPRESSED_DATA;
  return mz_zip_writer_add_mem_ex_v2(&zip, name.c_str(), data, size, nullptr, 0, flags, entry.size, entry.crc, &time,
                                     nullptr, 0, nullptr, 0) != MZ_FALSE;
}

ScopedZipArchive::ScopedZipArchive(std::wstring_view archivePath) : m_writer(std::make_unique<Writer>()) {
  if (m_writer->Open(archivePath)) return;
  const DWORD error = GetLastError();
  m_writer.reset();
  constexpr wchar_t kScope[] = L"stutil::ScopedZipArchive::ScopedZipArchive";
  LOG_ERROR(kScope, L"error creating zip file %s", std::wstring(archivePath).c_str());
  LOG_TRACE(kScope, L"error %u", error);
}

ScopedZipArchive::~ScopedZipArchive() {
  if (!m_writer) return;
  const bool isFinalized = mz_zip_writer_finalize_archive(&m_writer->zip) != MZ_FALSE;
  const DWORD error = isFinalized ? m_writer->file.Publish(m_writer->zip.m_archive_size) : m_writer->file.Error();
  if (isFinalized && error == ERROR_SUCCESS) return;
  constexpr wchar_t kScope[] = L"stutil::ScopedZipArchive::~ScopedZipArchive";
  LOG_ERROR(kScope, L"error on archive finalize");
  LOG_TRACE(kScope, L"error %u", error);
}

bool ScopedZipArchive::IsOpen() const {
  return m_writer != nullptr;
}

bool ScopedZipArchive::IsBroken() const {
  return !m_writer || m_writer->file.Error() != ERROR_SUCCESS;
}

const std::wstring& ScopedZipArchive::PartialPath() const {
  return m_writer->file.PartialPath();
}

bool ScopedZipArchive::Add(const ZipEntry& entry, std::span<const uint8_t> deflated) {
  if (entry.size == 0) return m_writer->AddData({entry.name, entry.lastWriteTime}, nullptr, 0);
  return m_writer->AddData(entry, deflated.data(), deflated.size());
}

void ScopedZipArchive::BeginEntry(std::wstring_view name) {
  // The library writes a local header without extra fields in front of the data, whose place is known by that.
  m_writer->aheadOffset = m_writer->zip.m_archive_size + kLocalHeaderSize + ToUtf8(name).size();
  m_writer->aheadSize = 0;
}

bool ScopedZipArchive::Append(std::span<const uint8_t> deflated) {
  const uint64_t offset = m_writer->aheadOffset + m_writer->aheadSize;
  m_writer->aheadSize += deflated.size();
  return m_writer->file.Write(offset, deflated.data(), deflated.size());
}

bool ScopedZipArchive::EndEntry(const ZipEntry& entry) {
  if (entry.size == 0) return Add(entry, {});
  return m_writer->AddData(entry, &m_writer->aheadOffset, static_cast<size_t>(m_writer->aheadSize));
}

}  // namespace stutil
