#include "report/archive.h"

#include <miniz.h>

#include <set>

#include "report/entry_name.h"

namespace report {

struct Archive::Reader {
  mz_zip_archive zip{};
  ~Reader() { mz_zip_reader_end(&zip); }
};

namespace {

// The whole name; the library's own record of an entry holds only the first 511 bytes.
std::string NameOf(mz_zip_archive& zip, mz_uint index) {
  std::string name(mz_zip_reader_get_filename(&zip, index, nullptr, 0), '\0');
  if (name.empty()) return name;
  mz_zip_reader_get_filename(&zip, index, name.data(), static_cast<mz_uint>(name.size()));
  name.pop_back();  // the terminator
  return name;
}

// A link, device or whatever else is neither a file nor a folder. Both halves are asked, whatever system the entry says
// it comes from: the upper holds the file's mode on Unix, the lower the file attributes of Windows.
bool IsSpecial(mz_uint32 attributes) {
  constexpr mz_uint32 kTypeMask = 0170000, kFolder = 0040000, kFile = 0100000, kReparsePoint = 0x400;
  const mz_uint32 type = attributes >> 16 & kTypeMask;
  return (type != 0 && type != kFolder && type != kFile) || (attributes & kReparsePoint) != 0;
}

const char* EntryFault(const mz_zip_archive_file_stat& entry) {
  if (IsSpecial(entry.m_external_attr)) return "is a link or a special file";
  if (entry.m_is_encrypted) return "is encrypted";
  if (!entry.m_is_supported) return "is compressed by an unknown method";
  const bool grows = entry.m_uncomp_size >= kRatioMattersFrom && entry.m_uncomp_size / kMostRatio > entry.m_comp_size;
  return grows ? "is compressed too strongly to be genuine" : nullptr;
}

}  // namespace

Archive::Archive(std::unique_ptr<Reader> reader) : m_reader(std::move(reader)) {}
Archive::~Archive() = default;

std::unique_ptr<Archive> Archive::Open(std::string_view bytes, std::string& error) {
  auto reader = std::make_unique<Reader>();
  if (!mz_zip_reader_init_mem(&reader->zip, bytes.data(), bytes.size(), MZ_ZIP_FLAG_DO_NOT_SORT_CENTRAL_DIRECTORY)) {
    error =
        std::string("is no sound zip archive (") + mz_zip_get_error_string(mz_zip_get_last_error(&reader->zip)) + ")";
    return nullptr;
  }
  if (mz_zip_reader_get_num_files(&reader->zip) > kMostEntries) {
    error = "holds more than " + std::to_string(kMostEntries) + " entries";
    return nullptr;
  }
  std::unique_ptr<Archive> archive(new Archive(std::move(reader)));  // the constructor is private
  archive->ListEntries();
  return archive;
}

void Archive::ListEntries() {
  mz_zip_archive& zip = m_reader->zip;
  std::set<std::string> keys;
  uint64_t content = 0;
  for (mz_uint i = 0; i < mz_zip_reader_get_num_files(&zip); ++i) {
    std::string name = NameOf(zip, i);
    const char* fault = EntryNameFault(name);
    mz_zip_archive_file_stat stat{};
    if (!mz_zip_reader_file_stat(&zip, i, &stat)) {
      fault = "has a damaged header";
    } else if (fault == nullptr) {
      fault = EntryFault(stat);
    }
    if (fault == nullptr && stat.m_uncomp_size > kMostContent - content) fault = "does not fit the limit of content";
    if (fault == nullptr && !keys.insert(EntryNameKey(name)).second) fault = "is there twice";
    if (fault != nullptr) {
      m_leftOut.push_back({std::move(name), "", fault});
      continue;
    }
    content += stat.m_uncomp_size;
    m_entries.push_back({std::move(name), stat.m_uncomp_size, i});
  }
}

bool Archive::Read(const ArchiveEntry& entry, std::string& bytes, std::string& error) const {
  mz_zip_archive& zip = m_reader->zip;
  bytes.resize(static_cast<size_t>(entry.size));
  // The library stops at the end of the buffer, and takes nothing whose size or checksum is another.
  if (mz_zip_reader_extract_to_mem(&zip, entry.index, bytes.data(), bytes.size(), 0)) return true;
  bytes.clear();
  error = std::string("cannot be unpacked (") + mz_zip_get_error_string(mz_zip_get_last_error(&zip)) + ")";
  return false;
}

}  // namespace report
