// Exports of JULIAN_DAY, MIDNIGHT_SECONDS, WEEK, WEEK_ISO, QUARTER,
// DAYOFYEAR, DAYOFWEEK and DAYOFWEEK_ISO.
//
// Each routine has two exports that differ in how far they read the text:
// one reads only the date at its head, the other validates a time of day
// behind it too.  Which digit is which differs between routines; the pairs
// below say it for each.  Parse, compute, store: a failed parse raises its
// SYSFUN code and leaves the result unwritten.
#include <cstdint>

#include "calendar/parse.hpp"
#include "datetime/numbers.hpp"
#include "frame/frame.hpp"
#include "routines.hpp"

namespace {

using cli::Answer;
using cli::success;
using cli::Sysfun;
using DateNumber = std::int32_t (*)(std::int32_t, std::int32_t, std::int32_t);

// Reads only the date at the head of the text; every failure is 04.
template <DateNumber compute>
Answer<std::int32_t> fromDatePart(cli::WritableTextIn text) noexcept {
  std::int32_t y = 0, m = 0, d = 0;
  if (cli::CLI_parseDatePart(text.chars(), &y, &m, &d) == 0) {
    return cli::failure<std::int32_t>(Sysfun::badDate);
  }
  return success(compute(y, m, d));
}

// Validates the whole text, a time of day included; fails with 04 or 06.
template <DateNumber compute>
Answer<std::int32_t> fromDateText(cli::WritableTextIn text) noexcept {
  std::int32_t y = 0, m = 0, d = 0;
  char code[3];
  if (cli::CLI_parseDateText(text.chars(), &y, &m, &d, nullptr, nullptr, nullptr, code) == 0) {
    return cli::failure<std::int32_t>(cli::sysfunOf(code));
  }
  return success(compute(y, m, d));
}

constexpr std::int32_t secondsOf(std::int32_t h, std::int32_t m, std::int32_t s) {
  return h * 3600 + m * 60 + s;
}

}  // namespace

namespace cli {

Answer<std::int32_t> routine::JULIAN_DAY1(WritableTextIn date) noexcept {
  return fromDatePart<cli::CLI_julianDay>(date);
}
Answer<std::int32_t> routine::JULIAN_DAY2(WritableTextIn date) noexcept {
  return fromDateText<cli::CLI_julianDay>(date);
}
Answer<std::int32_t> routine::WEEK1(WritableTextIn date) noexcept {
  return fromDatePart<cli::CLI_weekOfYear>(date);
}
Answer<std::int32_t> routine::WEEK2(WritableTextIn date) noexcept {
  return fromDateText<cli::CLI_weekOfYear>(date);
}
Answer<std::int32_t> routine::WEEK_ISO1(WritableTextIn date) noexcept {
  return fromDatePart<cli::CLI_isoWeekOfYear>(date);
}
Answer<std::int32_t> routine::WEEK_ISO2(WritableTextIn date) noexcept {
  return fromDateText<cli::CLI_isoWeekOfYear>(date);
}
Answer<std::int32_t> routine::QUARTER1(WritableTextIn date) noexcept {
  return fromDatePart<cli::CLI_quarter>(date);
}
Answer<std::int32_t> routine::QUARTER2(WritableTextIn date) noexcept {
  return fromDateText<cli::CLI_quarter>(date);
}
Answer<std::int32_t> routine::DAYOFYEAR1(WritableTextIn date) noexcept {
  return fromDatePart<cli::CLI_dayOfYear>(date);
}
Answer<std::int32_t> routine::DAYOFYEAR2(WritableTextIn date) noexcept {
  return fromDateText<cli::CLI_dayOfYear>(date);
}
// For the days of the week the digits run the other way.
Answer<std::int32_t> routine::DAYOFWEEK1(WritableTextIn date) noexcept {
  return fromDateText<cli::CLI_dayOfWeek>(date);
}
Answer<std::int32_t> routine::DAYOFWEEK2(WritableTextIn date) noexcept {
  return fromDatePart<cli::CLI_dayOfWeek>(date);
}
Answer<std::int32_t> routine::DAYOFWEEK_ISO1(WritableTextIn date) noexcept {
  return fromDateText<cli::CLI_isoDayOfWeek>(date);
}
Answer<std::int32_t> routine::DAYOFWEEK_ISO2(WritableTextIn date) noexcept {
  return fromDatePart<cli::CLI_isoDayOfWeek>(date);
}

// A time alone; 05 when it is no time.
Answer<std::int32_t> routine::MIDNIGHT_SECONDS1(WritableTextIn time) noexcept {
  std::int32_t h = 0, m = 0, s = 0;
  if (CLI_parseTimeText(kTimeMode, time.chars(), &h, &m, &s) == 0) {
    return failure<std::int32_t>(Sysfun::badTime);
  }
  return success(secondsOf(h, m, s));
}

// A time, or a date or timestamp: 9 bytes or more after trimming is read as
// a date, as no time text is that long.
Answer<std::int32_t> routine::MIDNIGHT_SECONDS2(WritableTextIn value) noexcept {
  char *text = value.chars();
  std::int32_t y = 0, mo = 0, d = 0, h = 0, m = 0, s = 0;
  if (CLI_trimBlanks(text) >= 9) {
    char code[3];
    if (CLI_parseDateText(text, &y, &mo, &d, &h, &m, &s, code) == 0) {
      return failure<std::int32_t>(sysfunOf(code));
    }
  } else if (CLI_parseTimeText(kTimeMode, text, &h, &m, &s) == 0) {
    return failure<std::int32_t>(Sysfun::badTime);
  }
  return success(secondsOf(h, m, s));
}

}  // namespace cli
