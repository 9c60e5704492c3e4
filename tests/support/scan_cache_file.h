// Makes the bytes of scan cache files for tests: a whole file, which a test may then damage.
#pragma once

#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "systeminfo/scan_cache_format.h"

namespace scan_cache_file {

inline void Put(std::string& bytes, uint64_t number, size_t size) {
  for (size_t i = 0; i < size; ++i)
    bytes += static_cast<char>(number >> (8 * i));
}

inline std::string RecordBytes(const systeminfo::ScanCacheRecord& record) {
  std::string bytes;
  Put(bytes, record.fileReferenceNumber, 8);
  Put(bytes, record.volumeSerialNumber, 4);
  Put(bytes, record.references, 4);
  Put(bytes, record.keyAndScan, 4);
  Put(bytes, record.scanPhase, 2);
  Put(bytes, record.flagFromDat, 2);
  Put(bytes, record.cloudFlags, 4);
  Put(bytes, record.internalFlags, 4);
  Put(bytes, record.lastAccessTime, 8);
  Put(bytes, record.lastScanTime, 8);
  Put(bytes, record.extraFlags1, 2);
  Put(bytes, record.extraFlags2, 2);
  for (const uint32_t key : record.databaseKeys)
    Put(bytes, key, 4);
  Put(bytes,
      (record.scanEmail ? 1 : 0) | (record.scanPacked ? 2 : 0) | (record.scanArchives ? 4 : 0) |
          (record.deepScan ? 8 : 0) | 0xF0,
      1);  // unused bits are set: nobody may read them
  Put(bytes, record.maxArchiveDepthLevel, 1);
  Put(bytes, 0xFFFF, 2);  // reserved
  Put(bytes, record.maxArchiveFileSize, 4);
  return bytes;
}

// `count` is what the header claims. What belongs to neither count nor records is filled with 0xEE.
inline std::string FileBytes(uint32_t count, const std::vector<systeminfo::ScanCacheRecord>& records) {
  std::string bytes(0x70000, '\xEE');
  std::string field;
  Put(field, count, 4);
  std::copy(field.begin(), field.end(), bytes.begin() + 0x23894);
  for (const systeminfo::ScanCacheRecord& record : records)
    bytes += RecordBytes(record);
  return bytes;
}

}  // namespace scan_cache_file
