// What the module's parts share: the exports found in the library, the
// reports of a status or a bad argument as PostgreSQL errors, and the date
// and time values in the library's text forms.
//
// Include after server.hpp.
#pragma once

#include <cstddef>
#include <cstdint>

#include "calendar/calendar.hpp"
#include "common/exports.hpp"
#include "frame/call.hpp"

namespace orv::pg {

// The export of each catalogue row, found by its name in the library when
// the module is loaded.
extern host::Exports gExports;

// Raises the status that a routine stored as an ERROR: a SYSFUN error with
// SQLSTATE 38552 and its code in words, any other status with its own
// SQLSTATE and message.  Does not return.
[[noreturn]] void reportStatus(FunctionCallInfo fcinfo, const cli::call::StatusBuffers &status);

// Raises an ERROR about argument `i` (from 0) of the function being called.
[[noreturn]] void reportArgument(FunctionCallInfo fcinfo, int sqlstate, int i, const char *name,
                                 const char *what);

// The database information block for DAYNAME and MONTHNAME: the code page
// of the database's encoding.  Raises an ERROR for an encoding that has none.
const void *databaseInfo(FunctionCallInfo fcinfo);

// The library's text forms of date and time values, written with integer
// arithmetic: 2001-09-27, 13.30.15, 2001-09-27-13.30.15.000000.  Each
// returns the length, or 0 when the value lies outside the years 1 to 9999
// (or is infinite).
std::size_t dateText(DateADT date, char *out);
std::size_t timeText(TimeADT time, char *out);
std::size_t timestampText(Timestamp stamp, char *out);

// The lengths of those forms, and whether a value has one: told apart
// before the text is written, so that it can be written where the routine
// reads it.
inline constexpr std::size_t kDateSize = 10, kTimeSize = 8, kTimestampSize = 26;

// PostgreSQL counts days from 2000-01-01, the library from day number 1,
// 0001-01-01.
inline constexpr std::int32_t kDayNumberOfDayZero = cli::CLI_dayNumber(2000, 1, 1);

// 0001-01-01 and 9999-12-31 in PostgreSQL's days since 2000-01-01.
inline constexpr std::int64_t kFirstDay = cli::CLI_dayNumber(1, 1, 1) - kDayNumberOfDayZero;
inline constexpr std::int64_t kLastDay = cli::CLI_dayNumber(9999, 12, 31) - kDayNumberOfDayZero;
static_assert(kFirstDay == -730119 && kLastDay == 2921939);

inline bool dateFits(DateADT date) {
  return !DATE_NOT_FINITE(date) && date >= kFirstDay && date <= kLastDay;
}
inline bool timestampFits(Timestamp stamp) {
  if (TIMESTAMP_NOT_FINITE(stamp)) return false;
  const std::int64_t days = stamp / USECS_PER_DAY - (stamp % USECS_PER_DAY < 0 ? 1 : 0);
  return days >= kFirstDay && days <= kLastDay;
}

// A timestamp text of exactly the form 2001-09-27-13.30.15.000000 as a
// timestamp; false for any other text.
bool timestampOf(const char *text, std::size_t size, Timestamp &out);

// Text that the database can hold: valid in its encoding.  Raises an ERROR
// that points to bytea for anything else.
text *resultText(FunctionCallInfo fcinfo, const char *data, std::size_t size);
bytea *resultBytes(const void *data, std::size_t size);

}  // namespace orv::pg
