// The entry point of support_report: arguments from the system, texts to the console.
#include <windows.h>

#include <algorithm>
#include <string>
#include <vector>

#include "core/dynamic_library.h"
#include "core/text.h"
#include "report/program.h"

namespace {

// A console shows UTF-16 whatever its code page; files and pipes get the UTF-8 as it is.
void Write(DWORD stream, std::string_view utf8) {
  const HANDLE handle = GetStdHandle(stream);  // the process's own; nobody closes it
  DWORD mode = 0;
  DWORD written = 0;
  if (GetConsoleMode(handle, &mode)) {
    constexpr size_t kChunk = 8192;  // characters; older consoles refuse more than 64 KiB
    const std::wstring wide = ToWide(utf8);
    for (size_t begin = 0; begin < wide.size(); begin += kChunk) {
      const auto count = static_cast<DWORD>(std::min(kChunk, wide.size() - begin));
      if (!WriteConsoleW(handle, wide.data() + begin, count, &written, nullptr)) return;
    }
    return;
  }
  while (!utf8.empty()) {
    if (!WriteFile(handle, utf8.data(), static_cast<DWORD>(utf8.size()), &written, nullptr) || written == 0) return;
    utf8.remove_prefix(written);
  }
}

// One line on a terminal that each step replaces; nothing in a file or pipe.
class ProgressLine {
 public:
  ProgressLine() {
    DWORD mode = 0;
    m_isShown = GetConsoleMode(GetStdHandle(STD_ERROR_HANDLE), &mode) != FALSE;
  }
  void Show(std::string_view step) const {
    constexpr size_t kWidth = 40;
    std::string line(step);
    line.resize(kWidth, ' ');
    if (m_isShown) Write(STD_ERROR_HANDLE, "\r" + line + "\r");
  }

 private:
  bool m_isShown = false;
};

}  // namespace

int wmain(int count, wchar_t** elements) {
  RestrictLibrarySearch();
  const ProgressLine line;
  const report::ProgramOutput output =
      report::RunProgram(std::vector<std::wstring>(elements + std::min(count, 1), elements + count),
                         [&line](std::string_view step) { line.Show(step); });
  line.Show("");
  Write(STD_OUTPUT_HANDLE, output.text);
  Write(STD_ERROR_HANDLE, output.messages);
  return static_cast<int>(output.code);
}
