#include "monitoring/note.h"

#include "core/logging.h"

namespace st::monitoring {

void LogNote(const Note& note) {
  ST_LOG(static_cast<logging::Level>(note.level), note.function, L"%s", note.text.c_str());
}

}  // namespace st::monitoring
