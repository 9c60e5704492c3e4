// Sends a finished package to the maker's file-submission service through the cloud communication library.
#pragma once

#include <string>

namespace stutil {

// Blocks until the upload is over; true when it succeeded. Failures are logged. The first argument is reserved: pass 0.
bool TessaroSubmitFile(int reserved, const std::wstring& path);

}  // namespace stutil
