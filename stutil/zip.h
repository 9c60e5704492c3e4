// Packs folders into one zip archive of at most 50 MiB of files, the newest ones first. Files that are in use are
// packed as they are at that moment; a file that cannot be read is tried once more through a copy beside it.
#pragma once

#include <string>
#include <vector>

#include "stutil/scoped_zip_archive.h"

namespace stutil {

// True when the archive could be created and the pass over the files ran, whatever became of single files; failures are
// logged. A file that grows meanwhile is cut at the size it was found with; one that shrinks is packed as it is. An
// archive that is there already is replaced. Under `archivePath` stands a whole archive or nothing: when the disk is
// full, say, there is none although the result is true. Uses all cores; blocks until it is done.
bool CompressWithSizeLimit_MostRecentFirst(const std::vector<std::wstring>& folders, const std::wstring& archivePath);

}  // namespace stutil
