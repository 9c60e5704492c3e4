#include "report/entry_name.h"

#include <algorithm>
#include <iterator>

#include "core/paths.h"
#include "core/text.h"
#include "report/windows_text.h"

namespace report {
namespace {

// The digits that may end COM and LPT: also the superscripts one, two and three, as UTF-8.
constexpr std::string_view kPortDigits[] = {"0", "1", "2", "3",        "4",        "5",       "6",
                                            "7", "8", "9", "\xC2\xB9", "\xC2\xB2", "\xC2\xB3"};
constexpr std::string_view kDevices[] = {"con", "prn", "aux", "nul", "conin$", "conout$", "clock$"};

// Devices answer to their names with any extension, and with blanks before it.
bool IsDeviceName(std::string_view component) {
  const std::string base = LowerAscii(Trimmed(component.substr(0, component.find('.'))));
  if (std::find(std::begin(kDevices), std::end(kDevices), base) != std::end(kDevices)) return true;
  if (!base.starts_with("com") && !base.starts_with("lpt")) return false;
  return std::find(std::begin(kPortDigits), std::end(kPortDigits), std::string_view(base).substr(3)) !=
         std::end(kPortDigits);
}

const char* ComponentFault(std::string_view component) {
  if (component.empty()) return "has an empty component";
  if (component == "." || component == "..") return "leads out of its folder";
  if (component.back() == '.' || component.back() == ' ') return "has a component that ends in a dot or a blank";
  if (IsDeviceName(component)) return "names a device";
  if (ToWide(component).size() > kLongestNameComponent) return "has a component that is too long";
  return nullptr;
}

const char* CharacterFault(std::string_view name) {
  for (const char c : name) {
    if (c == '\\') return "holds a backslash";
    if (c == ':') return "names a drive or an alternate stream";
    if (static_cast<unsigned char>(c) < 0x20 || c == 0x7F) return "holds a control character";
    if (std::string_view("<>\"|?*").find(c) != std::string_view::npos) return "holds a character that no file name can";
  }
  return ToUtf8(ToWide(name)) == name ? nullptr : "is no UTF-8 text";
}

}  // namespace

const char* EntryNameFault(std::string_view name) {
  if (name.empty()) return "is empty";
  if (name.size() > kLongestEntryName) return "is too long";
  if (name.front() == '/') return "begins at a root";
  if (const char* const fault = CharacterFault(name)) return fault;
  if (name.back() == '/') name.remove_suffix(1);
  if (static_cast<size_t>(std::count(name.begin(), name.end(), '/')) >= kDeepestEntryName) return "is too deep";
  for (size_t begin = 0; begin <= name.size();) {
    const size_t end = std::min(name.find('/', begin), name.size());
    if (const char* const fault = ComponentFault(name.substr(begin, end - begin))) return fault;
    begin = end + 1;
  }
  return nullptr;
}

std::string EntryNameKey(std::string_view name) {
  if (name.ends_with('/')) name.remove_suffix(1);
  return LowerAscii(name);
}

std::wstring EntryPath(std::wstring_view folder, std::string_view name) {
  std::wstring part = ToWide(name);
  std::replace(part.begin(), part.end(), L'/', L'\\');
  return std::wstring(JoinPath(folder, WithoutEndSeparators(part)));
}

}  // namespace report
