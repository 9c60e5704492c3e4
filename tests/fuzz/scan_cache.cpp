// A scan cache file. Its fixed header is half a megabyte: an input holds the count, how much of the header is there,
// and the records.
#include <memory>

#include "systeminfo/scan_cache_format.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  using namespace systeminfo;
  Input input(bytes);
  const auto count = input.Take<uint32_t>();
  const auto most = input.Take<uint16_t>();
  const auto missing = input.Take<uint8_t>();  // 0: the header is whole
  const size_t headerSize = missing == 0         ? kScanCacheRecordsOffset
                            : (missing & 1) != 0 ? kScanCacheCountOffset + missing % 8
                                                 : kScanCacheRecordsOffset - missing;
  const std::string_view records = missing == 0 ? input.Rest() : std::string_view();
  const size_t size = headerSize + records.size();
  const auto file = std::make_unique<char[]>(size);
  for (size_t i = 0; i < sizeof count && kScanCacheCountOffset + i < size; ++i)
    file[kScanCacheCountOffset + i] = static_cast<char>(count >> 8 * i);
  records.copy(file.get() + headerSize, records.size());

  const ScanCache cache = ParseScanCache({file.get(), size}, most);
  const size_t wanted = std::min<size_t>(count, most);
  PROMISE(cache.hasHeader == (headerSize >= kScanCacheCountOffset + sizeof count));
  if (!cache.hasHeader) return;
  PROMISE(cache.entryCount == count);
  PROMISE(cache.records.size() == std::min(wanted, records.size() / kScanCacheRecordSize));
  PROMISE(cache.isCutShort == (cache.records.size() < wanted));
}
