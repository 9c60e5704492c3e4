// A buffer of event records as the event log service fills it.
#include "systeminfo/event_record.h"

#include "core/text.h"
#include "tests/fuzz/fuzz.h"

namespace {

bool IsUtf8(const std::string& text) {
  return ToUtf8(ToWide(text)) == text;
}

}  // namespace

void FuzzOne(std::string_view bytes) {
  systeminfo::EventRecordReader reader(bytes);
  systeminfo::EventRecord record;
  size_t nextOffset = 0;
  while (reader.Next(record)) {
    PROMISE(reader.Offset() >= nextOffset && reader.Offset() < bytes.size());
    nextOffset = reader.Offset() + 56;  // the fixed part of a record
    PROMISE(IsUtf8(record.sourceName) && IsUtf8(record.computerName));
    for (const std::string& text : record.insertionStrings)
      PROMISE(IsUtf8(text));
  }
  PROMISE(reader.Offset() == bytes.size() || reader.Damage() != nullptr);
}
