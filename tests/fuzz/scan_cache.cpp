// A scan cache file. Its fixed header is half a megabyte: an input holds the count, how much of the header is missing,
// and the records.
#include "systeminfo/scan_cache_format.h"
#include "tests/fuzz/fuzz.h"

namespace {

using namespace systeminfo;

constexpr size_t kMostRecordBytes = 4096;

size_t HeaderSize(uint8_t missing) {
  if (missing == 0) return kScanCacheRecordsOffset;
  return (missing & 1) != 0 ? kScanCacheCountOffset + missing % 8 : kScanCacheRecordsOffset - missing;
}

void Check(std::string_view file, uint32_t count, size_t most, size_t recordBytes) {
  const ScanCache cache = ParseScanCache(file, most);
  const size_t wanted = std::min<size_t>(count, most);
  PROMISE(cache.hasHeader == (file.size() >= kScanCacheCountOffset + sizeof count));
  if (!cache.hasHeader) return;
  PROMISE(cache.entryCount == count);
  PROMISE(cache.records.size() == std::min(wanted, recordBytes / kScanCacheRecordSize));
  PROMISE(cache.isCutShort == (cache.records.size() < wanted));
}

}  // namespace

void FuzzOne(std::string_view bytes) {
  Input input(bytes);
  const auto count = input.Take<uint32_t>();
  const auto most = input.Take<uint16_t>();
  const size_t headerSize = HeaderSize(input.Take<uint8_t>());
  const bool isWhole = headerSize == kScanCacheRecordsOffset;
  const std::string_view records = isWhole ? input.Rest().substr(0, kMostRecordBytes) : std::string_view();

  // Making half a megabyte anew for each file would be all that the fuzzer does. They share one memory of zeros, end
  // where it ends, so that a read beyond is seen, and are taken out of it again.
  static std::vector<char> s_memory(kScanCacheRecordsOffset + kMostRecordBytes);
  const size_t size = headerSize + records.size();
  char* const file = s_memory.data() + s_memory.size() - size;
  const size_t countBytes = std::min(sizeof count, size - std::min(size, kScanCacheCountOffset));
  for (size_t i = 0; i < countBytes; ++i)
    file[kScanCacheCountOffset + i] = static_cast<char>(count >> 8 * i);
  records.copy(file + headerSize, records.size());
  Check({file, size}, count, most, records.size());
  std::fill_n(file + kScanCacheCountOffset, countBytes, '\0');
  std::fill_n(file + headerSize, records.size(), '\0');
}
