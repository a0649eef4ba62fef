// Numbers that a date gives: Julian day, week of the year in two
// numberings, quarter, ordinal day and day of the week.  Each takes a date
// that the parser has validated.
#pragma once

#include <cstdint>

#include "calendar/calendar.hpp"

namespace cli {

constexpr std::int32_t CLI_julianDay(std::int32_t y, std::int32_t m, std::int32_t d) {
  return CLI_dayNumber(y, m, d) + kJulianDayOfDayZero;
}

constexpr std::int32_t CLI_quarter(std::int32_t, std::int32_t m, std::int32_t) {
  return (m - 1) / 3 + 1;
}

// Day of the week from the day number: 0001-01-01 is a Monday with number 1,
// so the remainder by 7 is 1 for Monday through 6 for Saturday, 0 for Sunday.
constexpr std::int32_t CLI_dayOfWeek(std::int32_t y, std::int32_t m, std::int32_t d) {
  return CLI_dayNumber(y, m, d) % 7 + 1;  // Sunday = 1
}

constexpr std::int32_t CLI_isoDayOfWeek(std::int32_t y, std::int32_t m, std::int32_t d) {
  const std::int32_t r = CLI_dayNumber(y, m, d) % 7;
  return r == 0 ? 7 : r;  // Monday = 1
}

// Weeks from Sunday to Saturday; week 1 runs from 1 January to the first
// Saturday, so the number never belongs to a neighbouring year (1 to 54).
constexpr std::int32_t CLI_weekOfYear(std::int32_t y, std::int32_t m, std::int32_t d) {
  const std::int32_t firstSaturday = 7 - (CLI_daysBeforeYear(y) + 1) % 7;
  const std::int32_t ordinal = CLI_dayOfYear(y, m, d);
  return ordinal <= firstSaturday ? 1 : (ordinal - firstSaturday - 1) / 7 + 2;
}

// ISO 8601 weeks: from Monday to Sunday, week 1 holding the year's first
// Thursday.  A year has 53 weeks when it starts on a Thursday, or on a
// Wednesday in a leap year; `first` counts 1 January's weekday from
// Monday = 0 (day number 1 is a Monday).
constexpr std::int32_t isoWeeksIn(std::int32_t first, std::int32_t leap) {
  return first == 3 || (leap == 1 && first == 2) ? 53 : 52;
}

constexpr std::int32_t CLI_isoWeekOfYear(std::int32_t y, std::int32_t m, std::int32_t d) {
  const std::int32_t before = CLI_daysBeforeYear(y);
  const std::int32_t ordinal = CLI_dayOfYear(y, m, d);
  const std::int32_t first = before % 7;
  const std::int32_t weekday = (first + ordinal - 1) % 7 + 1;  // Monday = 1
  const std::int32_t week = (ordinal - weekday + 10) / 7;
  if (week == 0) {
    // 1 to 3 January in the last week of the year before.
    const std::int32_t leapBefore = CLI_isLeapYear(y - 1);
    return isoWeeksIn((first + 6 - leapBefore) % 7, leapBefore);
  }
  return week == 53 && isoWeeksIn(first, CLI_isLeapYear(y)) == 52 ? 1 : week;
}

static_assert(CLI_weekOfYear(2000, 12, 31) == 54 && CLI_isoWeekOfYear(2000, 12, 31) == 52);
static_assert(CLI_weekOfYear(2005, 1, 1) == 1 && CLI_isoWeekOfYear(2005, 1, 1) == 53);
static_assert(CLI_weekOfYear(2001, 12, 31) == 53 && CLI_isoWeekOfYear(2001, 12, 31) == 1);
static_assert(CLI_isoWeekOfYear(9999, 1, 1) == 53 && CLI_isoWeekOfYear(2010, 1, 3) == 53);
static_assert(CLI_dayOfWeek(1, 1, 1) == 2 && CLI_isoDayOfWeek(2000, 12, 31) == 7);

}  // namespace cli
