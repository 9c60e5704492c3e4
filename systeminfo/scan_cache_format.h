// The bytes of the product's scan cache file "smartdb-ntfs.db": a header at fixed offsets and, behind it, one record of
// 72 bytes for each file that was scanned on an NTFS volume. Bytes in, plain values out; nothing in the file is
// trusted. All integers are little-endian.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>
#include <vector>

namespace systeminfo {

inline constexpr size_t kScanCacheCountOffset = 0x23894;    // 32 bits: how many records the file is meant to hold
inline constexpr size_t kScanCacheRecordsOffset = 0x70000;  // of the first record
inline constexpr size_t kScanCacheRecordSize = 72;

// One record. The comments give the byte offset in the record and the size of the field; the two bytes at 66 are
// reserved.
struct ScanCacheRecord {
  uint64_t fileReferenceNumber = 0;  //  0, 8: of NTFS; the upper 16 bits are its sequence number
  uint32_t volumeSerialNumber = 0;   //  8, 4: of the volume that the reference belongs to
  uint32_t references = 0;           // 12, 4
  uint32_t keyAndScan = 0;           // 16, 4
  uint16_t scanPhase = 0;            // 20, 2
  uint16_t flagFromDat = 0;          // 22, 2
  uint32_t cloudFlags = 0;           // 24, 4
  uint32_t internalFlags = 0;        // 28, 4
  uint64_t lastAccessTime = 0;       // 32, 8: as FILETIME, 100 ns since 1601 (UTC)
  uint64_t lastScanTime = 0;         // 40, 8: as FILETIME
  uint16_t extraFlags1 = 0;          // 48, 2
  uint16_t extraFlags2 = 0;          // 50, 2
  uint32_t databaseKeys[3] = {};     // 52, 3 x 4
  bool scanEmail = false;            // 64, bit 0
  bool scanPacked = false;           // 64, bit 1
  bool scanArchives = false;         // 64, bit 2
  bool deepScan = false;             // 64, bit 3
  uint8_t maxArchiveDepthLevel = 0;  // 65, 1
  uint32_t maxArchiveFileSize = 0;   // 68, 4
};

struct ScanCache {
  bool hasHeader = false;   // false: the file ends before its entry count; nothing else is set then
  uint32_t entryCount = 0;  // as the file claims
  std::vector<ScanCacheRecord> records;
  bool isCutShort = false;  // the bytes end before the last of the wanted records does
};

// Reads the first min(entry count, `mostRecords`) records, as far as they lie wholly in `bytes`, which are the
// beginning of the file or all of it.
ScanCache ParseScanCache(std::string_view bytes, size_t mostRecords);

}  // namespace systeminfo
