#include "companions/crash/dump_name.h"

#include <algorithm>
#include <tuple>

namespace crash {
namespace {

constexpr std::wstring_view kTimePattern = L"00000000-000000";  // a digit for each 0
constexpr std::wstring_view kExtension = L".dmp";
constexpr std::wstring_view kPartialExtension = L".dmp.partial";
constexpr size_t kLongestProgram = 200;  // keeps the whole name under the 255 characters of a file name

bool IsDigit(wchar_t c) {
  return c >= L'0' && c <= L'9';
}

std::wstring_view WithoutExe(std::wstring_view program) {
  constexpr size_t kLength = 4;
  if (program.size() > kLength) {
    const std::wstring_view end = program.substr(program.size() - kLength);
    if (end == L".exe" || end == L".EXE") program.remove_suffix(kLength);
  }
  return program.substr(0, kLongestProgram);
}

wchar_t* PutNumber(wchar_t* text, size_t digits, unsigned number) {
  for (size_t i = digits; i > 0; --i, number /= 10)
    text[i - 1] = static_cast<wchar_t>(L'0' + number % 10);
  return text + digits;
}

void PutTime(wchar_t* text, const DumpTime& time) {
  text = PutNumber(text, 4, time.year);
  text = PutNumber(text, 2, time.month);
  text = PutNumber(text, 2, time.day) + 1;  // the hyphen stands already
  text = PutNumber(text, 2, time.hour);
  text = PutNumber(text, 2, time.minute);
  PutNumber(text, 2, time.second);
}

// Takes "_" and what the pattern asks for from the end of `name`.
bool TakeTime(std::wstring_view& name) {
  if (name.size() <= kTimePattern.size()) return false;
  const std::wstring_view time = name.substr(name.size() - kTimePattern.size());
  const bool matches = std::equal(time.begin(), time.end(), kTimePattern.begin(),
                                  [](wchar_t c, wchar_t p) { return p == L'0' ? IsDigit(c) : c == p; });
  name.remove_suffix(kTimePattern.size());
  if (!matches || name.back() != L'_') return false;
  name.remove_suffix(1);
  return true;
}

bool HasNameWith(std::wstring_view name, std::wstring_view extension) {
  if (!name.ends_with(extension)) return false;
  name.remove_suffix(extension.size());
  if (!TakeTime(name)) return false;
  const size_t separator = name.find_last_of(L'_');
  return separator != std::wstring_view::npos && separator != 0 && separator + 1 < name.size() &&
         std::all_of(name.begin() + static_cast<std::ptrdiff_t>(separator) + 1, name.end(), IsDigit);
}

}  // namespace

DumpPath::DumpPath(std::wstring_view folder, std::wstring_view program, uint32_t processId, std::wstring_view kind) {
  std::wstring start(folder);
  start.append(L"\\")
      .append(WithoutExe(program))
      .append(kind)
      .append(L"_")
      .append(std::to_wstring(processId))
      .append(L"_");
  m_timeOffset = start.size();
  start.append(kTimePattern);
  m_path = start;
  m_path.append(kExtension);
  m_partial = start;
  m_partial.append(kPartialExtension);
}

void DumpPath::SetTime(const DumpTime& time) noexcept {
  PutTime(m_path.data() + m_timeOffset, time);
  PutTime(m_partial.data() + m_timeOffset, time);
}

bool IsDumpName(std::wstring_view name) {
  return HasNameWith(name, kExtension);
}
bool IsPartialDumpName(std::wstring_view name) {
  return HasNameWith(name, kPartialExtension);
}

void SortByAge(std::vector<DumpFile>& dumps) {
  std::sort(dumps.begin(), dumps.end(),
            [](const DumpFile& a, const DumpFile& b) { return std::tie(a.time, a.name) < std::tie(b.time, b.name); });
}

}  // namespace crash
