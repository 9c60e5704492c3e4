#include "companions/log/log_line.h"

#include <algorithm>
#include <cstdio>
#include <limits>

#include "interfaces/log_constants.h"

namespace logfile {
namespace {

const char* LevelName(uint32_t level) {
  switch (EffectiveLevel(level)) {
    case LOG_LEVEL_FATAL:
      return "FATAL";
    case LOG_LEVEL_CRITICAL:
      return "CRITICAL";
    case LOG_LEVEL_ERROR:
      return "ERROR";
    case LOG_LEVEL_WARNING:
      return "WARNING";
    case LOG_LEVEL_INFO:
      return "INFO";
    default:
      return "TRACE";
  }
}

bool IsControl(char c) {
  return (static_cast<unsigned char>(c) < 0x20 && c != '\t') || c == 0x7F;
}

// How many bytes at `position` are one line break: CR, LF, CR LF, and Unicode's NEL, LS and PS, which viewers honour
// too.
size_t LineBreakAt(std::string_view text, size_t position) {
  const std::string_view rest = text.substr(position);
  if (rest.starts_with("\r\n")) return 2;
  if (rest.starts_with('\r') || rest.starts_with('\n')) return 1;
  if (rest.starts_with("\xC2\x85")) return 2;
  if (rest.starts_with("\xE2\x80\xA8") || rest.starts_with("\xE2\x80\xA9")) return 3;
  return 0;
}

void AppendText(std::string& out, std::string_view text, std::string_view lineBreak) {
  for (size_t i = 0; i < text.size();) {
    if (const size_t length = LineBreakAt(text, i); length != 0) {
      out += lineBreak;
      i += length;
      continue;
    }
    if (IsControl(text[i])) {
      char escaped[8];
      std::snprintf(escaped, sizeof escaped, "\\x%02X", static_cast<unsigned char>(text[i]));
      out += escaped;
    } else {
      out += text[i];
    }
    ++i;
  }
}

std::string_view WithoutLineEnd(std::string_view text) {
  while (!text.empty() && (text.back() == '\r' || text.back() == '\n'))
    text.remove_suffix(1);
  return text;
}

// At most `most` bytes, not ending inside a character.
std::string_view Cut(std::string_view text, size_t most) {
  if (text.size() <= most) return text;
  while (most > 0 && (static_cast<unsigned char>(text[most]) & 0xC0) == 0x80)
    --most;
  return text.substr(0, most);
}

}  // namespace

std::string FormatLine(const Line& line) {
  char head[96];
  std::snprintf(head, sizeof head, "%04u-%02u-%02u %02u:%02u:%02u.%03u %-8s %u:%u ", line.time.year, line.time.month,
                line.time.day, line.time.hour, line.time.minute, line.time.second, line.time.millisecond,
                LevelName(line.level), static_cast<unsigned>(line.processId), static_cast<unsigned>(line.threadId));
  const std::string_view text = WithoutLineEnd(line.text);
  const std::string_view kept = Cut(text, kLongestText);
  std::string out = head;
  out.reserve(out.size() + kept.size() + 160);
  AppendText(out, line.module, " ");
  out += " [";
  AppendText(out, line.function, " ");
  out += "] ";
  out.append(size_t{kIndentWidth} * std::min(line.depth, kMostIndents), ' ');
  AppendText(out, kept, "\r\n    | ");
  if (kept.size() < text.size()) out += " (" + std::to_string(text.size() - kept.size()) + " more bytes)";
  out += "\r\n";
  return out;
}

uint32_t EffectiveLevel(uint32_t level) {
  for (uint32_t bit = LOG_LEVEL_FATAL; bit <= LOG_LEVEL_TRACE; bit <<= 1) {
    if ((level & bit) != 0) return bit;
  }
  return LOG_LEVEL_TRACE;
}

Indent ApplyStep(unsigned depth, int step) {
  if (step >= 0) {
    const unsigned room = std::numeric_limits<unsigned>::max() - depth;
    return {depth, depth + std::min(room, static_cast<unsigned>(step))};
  }
  const unsigned left = depth - std::min(depth, 0u - static_cast<unsigned>(step));
  return {left, left};
}

std::wstring LogFileName(std::wstring_view program, unsigned slot, std::wstring_view module, unsigned number) {
  std::wstring name(program);
  if (slot > 1) name += L"-" + std::to_wstring(slot);
  if (!module.empty()) {
    const bool looksLikeNumber = module.find_first_not_of(L"0123456789") == std::wstring_view::npos;
    name += looksLikeNumber ? L".module" : L".";
    name += module;
  }
  if (number > 0) name += L"." + std::to_wstring(number);
  return name + L".log";
}

std::vector<Renaming> PlanRotation(const std::vector<bool>& taken) {
  if (taken.empty()) return {};
  const auto free = std::find(taken.begin(), taken.end(), false);
  const size_t last = free == taken.end() ? taken.size() : static_cast<size_t>(free - taken.begin()) + 1;
  std::vector<Renaming> plan;
  for (size_t to = last; to > 0; --to)
    plan.push_back({static_cast<unsigned>(to - 1), static_cast<unsigned>(to)});
  return plan;
}

bool IsFull(uint64_t size, uint64_t more, uint64_t maxBytes) {
  return maxBytes != 0 && size != 0 && (size >= maxBytes || more > maxBytes - size);
}

}  // namespace logfile
