// The forms in which a collection's files write a moment, as seconds since 1970-01-01. Pure functions; no clock.
#pragma once

#include <optional>
#include <string_view>

namespace report {

inline constexpr double kHour = 3600;
inline constexpr double kDay = 24 * kHour;

// Local times may be this far from UTC (14 hours east), with an hour of summer time and one to spare.
inline constexpr double kLocalTimeSlack = 16 * kHour;

// "2024-03-04T09:05:07Z"; nothing for any other text.
std::optional<double> TimeFromIso(std::string_view text);

// "3/4/2024 09:05:07", the month first: the event log's local time, taken as if it were UTC.
std::optional<double> TimeFromEvent(std::string_view text);

// "20240304", a day's beginning; nothing for any other text.
std::optional<double> TimeFromDay(std::string_view text);

// Of units of 100 ns since 1601.
double SecondsFromFileTime(double units);

// How far local time is ahead of UTC by the name of a time zone, "(UTC+02:00) Bucharest" say; summer time is not in it.
std::optional<double> OffsetOfTimeZone(std::string_view caption);

}  // namespace report
