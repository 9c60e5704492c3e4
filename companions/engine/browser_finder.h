// Which browser of the machine shows the pages.
#pragma once

#include <string>

namespace engine {

// The full path of the first one that is there: Edge, Chrome or Chromium as registered for all users of the machine,
// the same in its usual folder, or a Unix one on the drive that shows the Unix file system. Empty: there is none. What
// a user registered for himself does not count: the program may run with more rights than he has.
std::wstring FindBrowser();

}  // namespace engine
