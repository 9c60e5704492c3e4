// One zip archive being written. It stands under "<path>.partial" until it is finalized, so that an archive under its
// final name is always a whole one. Entries are handed over compressed; what is written is never read again.
#pragma once

#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <string_view>

namespace stutil {

// What is known of an entry once all of it is compressed.
struct ZipEntry {
  std::wstring_view name;      // components divided by "/"
  uint64_t lastWriteTime = 0;  // seconds since 1970-01-01 UTC; stored as local time from 1980 to 2107
  uint64_t size = 0;           // uncompressed
  uint32_t crc = 0;
};

// Belongs to one thread.
class ScopedZipArchive {
 public:
  // Deletes an archive that is there already. A failure is logged; IsOpen tells.
  explicit ScopedZipArchive(std::wstring_view archivePath);

  // Finalizes the archive and gives it its name. When that fails, or a write failed before, it is logged and no file is
  // left.
  ~ScopedZipArchive();

  ScopedZipArchive(const ScopedZipArchive&) = delete;
  ScopedZipArchive& operator=(const ScopedZipArchive&) = delete;

  bool IsOpen() const;
  // True once a write failed (a full disk, say): nothing more can be added.
  bool IsBroken() const;
  // Where the archive lies until it is finalized.
  const std::wstring& PartialPath() const;

  // Adds a whole entry. `deflated` is a raw deflate stream; it is ignored for an entry without bytes.
  bool Add(const ZipEntry& entry, std::span<const uint8_t> deflated);

  // The same for an entry too big to be held in memory: its raw deflate stream comes in any number of parts, and is
  // forgotten unless EndEntry follows. `name` is that of the entry.
  void BeginEntry(std::wstring_view name);
  bool Append(std::span<const uint8_t> deflated);
  bool EndEntry(const ZipEntry& entry);

 private:
  struct Writer;
  std::unique_ptr<Writer> m_writer;
};

}  // namespace stutil
