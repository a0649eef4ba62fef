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

namespace {

using cli::Ind;
using cli::NameArg;
using cli::Status;
using DateNumber = std::int32_t (*)(std::int32_t, std::int32_t, std::int32_t);

// Reads only the date at the head of the text; every failure is 04.
template <DateNumber compute>
void fromDatePart(char *text, std::int32_t *result, Status status) noexcept {
  std::int32_t y = 0, m = 0, d = 0;
  if (cli::CLI_parseDatePart(text, &y, &m, &d) == 0) return status.raise(cli::Sysfun::badDate);
  *result = compute(y, m, d);
}

// Validates the whole text, a time of day included; fails with 04 or 06.
template <DateNumber compute>
void fromDateText(char *text, std::int32_t *result, Status status) noexcept {
  std::int32_t y = 0, m = 0, d = 0;
  char code[3];
  if (cli::CLI_parseDateText(text, &y, &m, &d, nullptr, nullptr, nullptr, code) == 0) {
    return status.raise(code);
  }
  *result = compute(y, m, d);
}

constexpr std::int32_t secondsOf(std::int32_t h, std::int32_t m, std::int32_t s) {
  return h * 3600 + m * 60 + s;
}

}  // namespace

#define CLI_DATE_EXPORT(name, reader, compute)                                              \
  CLI_EXPORT void name(char *text, std::int32_t *result, Ind, Ind, char *sqlstate, NameArg, \
                       NameArg, char *message) noexcept {                                   \
    reader<compute>(text, result, Status{sqlstate, message}); /* NOLINT */                  \
  }

CLI_DATE_EXPORT(CLI_udfJULIAN_DAY1, fromDatePart, cli::CLI_julianDay)
CLI_DATE_EXPORT(CLI_udfJULIAN_DAY2, fromDateText, cli::CLI_julianDay)
CLI_DATE_EXPORT(CLI_udfWEEK1, fromDatePart, cli::CLI_weekOfYear)
CLI_DATE_EXPORT(CLI_udfWEEK2, fromDateText, cli::CLI_weekOfYear)
CLI_DATE_EXPORT(CLI_udfWEEK_ISO1, fromDatePart, cli::CLI_isoWeekOfYear)
CLI_DATE_EXPORT(CLI_udfWEEK_ISO2, fromDateText, cli::CLI_isoWeekOfYear)
CLI_DATE_EXPORT(CLI_udfQUARTER1, fromDatePart, cli::CLI_quarter)
CLI_DATE_EXPORT(CLI_udfQUARTER2, fromDateText, cli::CLI_quarter)
CLI_DATE_EXPORT(CLI_udfDAYOFYEAR1, fromDatePart, cli::CLI_dayOfYear)
CLI_DATE_EXPORT(CLI_udfDAYOFYEAR2, fromDateText, cli::CLI_dayOfYear)
// For the days of the week the digits run the other way.
CLI_DATE_EXPORT(CLI_udfDAYOFWEEK1, fromDateText, cli::CLI_dayOfWeek)
CLI_DATE_EXPORT(CLI_udfDAYOFWEEK2, fromDatePart, cli::CLI_dayOfWeek)
CLI_DATE_EXPORT(CLI_udfDAYOFWEEK_ISO1, fromDateText, cli::CLI_isoDayOfWeek)
CLI_DATE_EXPORT(CLI_udfDAYOFWEEK_ISO2, fromDatePart, cli::CLI_isoDayOfWeek)

// A time alone; 05 when it is no time.
CLI_EXPORT void CLI_udfMIDNIGHT_SECONDS1(char *text, std::int32_t *result, Ind, Ind, char *sqlstate,
                                         NameArg, NameArg, char *message) noexcept {
  std::int32_t h = 0, m = 0, s = 0;
  if (cli::CLI_parseTimeText(cli::kTimeMode, text, &h, &m, &s) == 0) {
    return Status{sqlstate, message}.raise(cli::Sysfun::badTime);
  }
  *result = secondsOf(h, m, s);
}

// A time, or a date or timestamp: 9 bytes or more after trimming is read as
// a date, as no time text is that long.
CLI_EXPORT void CLI_udfMIDNIGHT_SECONDS2(char *text, std::int32_t *result, Ind, Ind, char *sqlstate,
                                         NameArg, NameArg, char *message) noexcept {
  const Status status{sqlstate, message};
  std::int32_t y = 0, mo = 0, d = 0, h = 0, m = 0, s = 0;
  if (cli::CLI_trimBlanks(text) >= 9) {
    char code[3];
    if (cli::CLI_parseDateText(text, &y, &mo, &d, &h, &m, &s, code) == 0) {
      return status.raise(code);
    }
  } else if (cli::CLI_parseTimeText(cli::kTimeMode, text, &h, &m, &s) == 0) {
    return status.raise(cli::Sysfun::badTime);
  }
  *result = secondsOf(h, m, s);
}
