// How a browser is started, as text. Includes no Windows header.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace engine {

// A browser that is no Windows program: found as /usr/bin/... on a drive that shows a Unix file system. It takes Unix
// paths, cannot inherit pipes and cannot be put into a job.
bool IsUnixProgram(std::wstring_view path);
std::wstring UnixPath(std::wstring_view path);  // without the drive, with "/"

struct BrowserStart {
  std::wstring program;
  std::wstring profile;     // folder
  std::wstring mark;        // file that is there as long as who started the browser
  uint64_t readHandle = 0;  // pipes that the browser inherits; 0: it opens a port
  uint64_t writeHandle = 0;
  bool hasSandbox = true;
};

// The whole command line. A Unix program is started by way of a shell that watches over it: see unix_watch.sh.
std::wstring BrowserCommandLine(const BrowserStart& start);

// By the rules of the C run-time library, which every browser's own start follows.
std::wstring QuoteArgument(std::wstring_view argument);

}  // namespace engine
