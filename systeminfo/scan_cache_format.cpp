#include "systeminfo/scan_cache_format.h"

#include <algorithm>

#include "core/little_endian.h"

namespace systeminfo {
namespace {

ScanCacheRecord ParseRecord(std::string_view bytes) {
  ScanCacheRecord record;
  record.fileReferenceNumber = ReadLittleEndian<uint64_t>(bytes, 0);
  record.volumeSerialNumber = ReadLittleEndian<uint32_t>(bytes, 8);
  record.references = ReadLittleEndian<uint32_t>(bytes, 12);
  record.keyAndScan = ReadLittleEndian<uint32_t>(bytes, 16);
  record.scanPhase = ReadLittleEndian<uint16_t>(bytes, 20);
  record.flagFromDat = ReadLittleEndian<uint16_t>(bytes, 22);
  record.cloudFlags = ReadLittleEndian<uint32_t>(bytes, 24);
  record.internalFlags = ReadLittleEndian<uint32_t>(bytes, 28);
  record.lastAccessTime = ReadLittleEndian<uint64_t>(bytes, 32);
  record.lastScanTime = ReadLittleEndian<uint64_t>(bytes, 40);
  record.extraFlags1 = ReadLittleEndian<uint16_t>(bytes, 48);
  record.extraFlags2 = ReadLittleEndian<uint16_t>(bytes, 50);
  for (size_t i = 0; i < std::size(record.databaseKeys); ++i)
    record.databaseKeys[i] = ReadLittleEndian<uint32_t>(bytes, 52 + i * sizeof(uint32_t));
  const uint8_t options = ReadLittleEndian<uint8_t>(bytes, 64);
  record.scanEmail = (options & 1) != 0;
  record.scanPacked = (options & 2) != 0;
  record.scanArchives = (options & 4) != 0;
  record.deepScan = (options & 8) != 0;
  record.maxArchiveDepthLevel = ReadLittleEndian<uint8_t>(bytes, 65);
  record.maxArchiveFileSize = ReadLittleEndian<uint32_t>(bytes, 68);
  return record;
}

}  // namespace

ScanCache ParseScanCache(std::string_view bytes, size_t mostRecords) {
  ScanCache cache;
  if (bytes.size() < kScanCacheCountOffset + sizeof(uint32_t)) return cache;
  cache.hasHeader = true;
  cache.entryCount = ReadLittleEndian<uint32_t>(bytes, kScanCacheCountOffset);
  bytes.remove_prefix(std::min(kScanCacheRecordsOffset, bytes.size()));
  const size_t wanted = std::min<size_t>(cache.entryCount, mostRecords);
  const size_t present = std::min(wanted, bytes.size() / kScanCacheRecordSize);
  cache.isCutShort = present < wanted;
  cache.records.reserve(present);
  for (size_t i = 0; i < present; ++i)
    cache.records.push_back(ParseRecord(bytes.substr(i * kScanCacheRecordSize, kScanCacheRecordSize)));
  return cache;
}

}  // namespace systeminfo
