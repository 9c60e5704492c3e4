// The product's logger configuration, read and changed.
#include "stutil/logger_xml.h"

#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  const auto read = stutil::ReadLoggerXml(bytes);
  const stutil::LoggerLevels wanted{"MODULE", "ALL"};
  const auto raised = stutil::WithLoggerLevels(bytes, wanted);
  PROMISE(read.has_value() == raised.has_value());
  if (!read) return;
  const auto reread = stutil::ReadLoggerXml(*raised);
  PROMISE(reread && reread->levels == wanted && reread->folder == read->folder);
  // Put back as it was.
  const auto restored = stutil::WithLoggerLevels(*raised, read->levels);
  PROMISE(restored && stutil::ReadLoggerXml(*restored) && stutil::ReadLoggerXml(*restored)->folder == read->folder);
}
