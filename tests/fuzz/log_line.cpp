// The layout of a log record, and the steps of its indentation. Lines: module, function, text.
#include "companions/log/log_line.h"

#include "core/text.h"
#include "tests/fuzz/fuzz.h"

void FuzzOne(std::string_view bytes) {
  using namespace logfile;
  Input input(bytes);
  const auto level = input.Take<uint32_t>();
  const auto step = input.Take<int32_t>();
  const auto depth = input.Take<uint32_t>();
  const Indent indent = ApplyStep(depth, step);
  PROMISE(step >= 0 ? indent.after >= depth : indent.after <= depth);
  PROMISE(indent.ofLine == std::min(depth, indent.after));

  const std::string_view module = input.TakeLine();
  const std::string_view function = input.TakeLine();
  const std::string text = FormatLine({{2026, 3, 1, 7, 8, 9, 12}, level, 1, 2, module, function, input.Rest(), depth});
  PROMISE(text.starts_with("2026-03-01 07:08:09.012 ") && text.ends_with("\r\n"));
  for (size_t i = 0; i + 2 < text.size(); ++i) {  // a record begins with a digit, a line within it never
    const auto c = static_cast<unsigned char>(text[i]);
    if (c == '\n') PROMISE(std::string_view(text).substr(i + 1).starts_with("    | "));
    PROMISE(c >= ' ' || c == '\t' || c == '\r' || c == '\n');
  }
  const std::wstring name = LogFileName(L"support_tool", step > 0 ? 2 : 1, ToWide(module), depth % 100);
  PROMISE(name.ends_with(L".log"));
}
