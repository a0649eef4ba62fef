// The numbers that a calendar date gives, from <chrono> alone: the
// reference that the unit tests and the fuzz targets hold the date
// routines against.
#pragma once

#include <chrono>
#include <cstdint>

namespace orv::model {

struct DateNumbers {
  std::int32_t julian, week, isoWeek, quarter, ordinal, dayOfWeek, isoDayOfWeek;
};

// Julian day 2440588 is 1970-01-01, the first day of sys_days.
inline constexpr std::int32_t kJulianOfEpoch = 2440588;

inline std::chrono::sys_days dayOfJulian(std::int64_t julian) {
  return std::chrono::sys_days{std::chrono::days{julian - kJulianOfEpoch}};
}

inline DateNumbers numbersOf(std::chrono::sys_days day) {
  using namespace std::chrono;
  const year_month_day ymd{day};
  const weekday wd{day};
  const sys_days newYear{ymd.year() / January / 1};
  const auto ordinal = static_cast<std::int32_t>((day - newYear).count()) + 1;
  const auto jan1 = static_cast<std::int32_t>(weekday{newYear}.c_encoding());
  // ISO weeks belong to the year of their Thursday.
  const sys_days thursday = day - days{wd.iso_encoding() - 1} + days{3};
  const sys_days isoNewYear{year_month_day{thursday}.year() / January / 1};
  return {static_cast<std::int32_t>(day.time_since_epoch().count()) + kJulianOfEpoch,
          (ordinal + jan1 - 1) / 7 + 1,
          static_cast<std::int32_t>((thursday - isoNewYear).count() / 7) + 1,
          static_cast<std::int32_t>((static_cast<unsigned>(ymd.month()) - 1) / 3 + 1),
          ordinal,
          static_cast<std::int32_t>(wd.c_encoding()) + 1,
          static_cast<std::int32_t>(wd.iso_encoding())};
}

// English names, as the stand-in's default locale gives them.
inline constexpr const char *kDayNames[] = {"Sunday",   "Monday", "Tuesday", "Wednesday",
                                            "Thursday", "Friday", "Saturday"};
inline constexpr const char *kMonthNames[] = {"January",   "February", "March",    "April",
                                              "May",       "June",     "July",     "August",
                                              "September", "October",  "November", "December"};

}  // namespace orv::model
