#include "report/times.h"

#include <array>
#include <charconv>
#include <chrono>

namespace report {
namespace {

// Takes a number of one to four digits and the character behind it ('\0': the end of the text).
std::optional<int> TakeNumber(std::string_view& text, char behind) {
  int number = 0;
  const auto [stop, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  const size_t length = static_cast<size_t>(stop - text.data());
  if (error != std::errc() || number < 0 || length > 4) return std::nullopt;
  text.remove_prefix(length);
  if (behind == '\0') return text.empty() ? std::optional(number) : std::nullopt;
  if (text.empty() || text.front() != behind) return std::nullopt;
  text.remove_prefix(1);
  return number;
}

// Six numbers, each with the character that must stand behind it.
std::optional<std::array<int, 6>> TakeNumbers(std::string_view text, const std::array<char, 6>& behind) {
  std::array<int, 6> numbers{};
  for (size_t i = 0; i < numbers.size(); ++i) {
    const auto number = TakeNumber(text, behind[i]);
    if (!number) return std::nullopt;
    numbers[i] = *number;
  }
  return numbers;
}

std::optional<double> Seconds(int year, int month, int day, int hour, int minute, int second) {
  const std::chrono::year_month_day date{std::chrono::year(year), std::chrono::month(static_cast<unsigned>(month)),
                                         std::chrono::day(static_cast<unsigned>(day))};
  if (!date.ok() || hour > 23 || minute > 59 || second > 60) return std::nullopt;
  return std::chrono::sys_days(date).time_since_epoch().count() * kDay + hour * kHour + minute * 60.0 + second;
}

}  // namespace

std::optional<double> TimeFromIso(std::string_view text) {
  if (!text.ends_with('Z')) return std::nullopt;
  text.remove_suffix(1);
  const auto n = TakeNumbers(text, {'-', '-', 'T', ':', ':', '\0'});
  return n ? Seconds((*n)[0], (*n)[1], (*n)[2], (*n)[3], (*n)[4], (*n)[5]) : std::nullopt;
}

std::optional<double> TimeFromEvent(std::string_view text) {
  const auto n = TakeNumbers(text, {'/', '/', ' ', ':', ':', '\0'});
  return n ? Seconds((*n)[2], (*n)[0], (*n)[1], (*n)[3], (*n)[4], (*n)[5]) : std::nullopt;
}

std::optional<double> TimeFromDay(std::string_view text) {
  if (text.size() != 8) return std::nullopt;
  std::string_view year = text.substr(0, 4);
  std::string_view month = text.substr(4, 2);
  std::string_view day = text.substr(6);
  const auto y = TakeNumber(year, '\0');
  const auto m = TakeNumber(month, '\0');
  const auto d = TakeNumber(day, '\0');
  return y && m && d ? Seconds(*y, *m, *d, 0, 0, 0) : std::nullopt;
}

double SecondsFromFileTime(double units) {
  return units / 1e7 - 11'644'473'600.0;
}

std::optional<double> OffsetOfTimeZone(std::string_view caption) {
  if (!caption.starts_with("(UTC") && !caption.starts_with("(GMT")) return std::nullopt;
  caption.remove_prefix(4);
  if (caption.starts_with(')')) return 0;
  const double sign = caption.starts_with('-') ? -1 : 1;
  if (!caption.starts_with('-') && !caption.starts_with('+')) return std::nullopt;
  caption.remove_prefix(1);
  const auto hours = TakeNumber(caption, ':');
  std::string_view rest = caption.substr(0, 2);
  const auto minutes = TakeNumber(rest, '\0');
  if (!hours || !minutes || *hours > 14 || *minutes > 59) return std::nullopt;
  return sign * (*hours * kHour + *minutes * 60.0);
}

}  // namespace report
