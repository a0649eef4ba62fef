// The grammar of date, time and timestamp text.
//
// Dates are read by position: four year digits, a hyphen, a month of one or
// two digits, a hyphen, a day, and then either the end of the text or one
// separator (a hyphen or a blank) and a time of day.  Times are an hour, a
// point or colon, two minute digits and optionally the same separator and
// two second digits; in a timestamp a point and up to 12 fraction digits
// may follow.  Trailing blanks (0x20 only) are cut in the caller's buffer
// by writing a NUL over the first of them, whatever the outcome.
#pragma once

#include <cstdint>

namespace cli {

// Reads a date or a timestamp and validates all of it.  Returns 1, or 0
// with "04" (the date, or the length) or "06" (the time of day) in `code`.
// hour, minute and second may be null; they are written only on success.
std::int32_t CLI_parseDateText(char *text, std::int32_t *year, std::int32_t *month,
                               std::int32_t *day, std::int32_t *hour, std::int32_t *minute,
                               std::int32_t *second, char *code) noexcept;

// Reads the date at the head of the text; what stands behind a separator
// is not read.  Returns 1 or 0.
std::int32_t CLI_parseDatePart(char *text, std::int32_t *year, std::int32_t *month,
                               std::int32_t *day) noexcept;

inline constexpr std::uint32_t kTimeMode = 0;       // a text that is only a time
inline constexpr std::uint32_t kTimestampMode = 1;  // the time part of a timestamp

// Reads a time of day.  In timestamp mode the byte before `text` is the
// date's separator and must match the time's style.  Returns 1 or 0;
// hour, minute and second may be null and are written only on success.
std::int32_t CLI_parseTimeText(std::uint32_t mode, char *text, std::int32_t *hour,
                               std::int32_t *minute, std::int32_t *second) noexcept;

// Cuts trailing blanks in place and returns the length that remains.
std::size_t CLI_trimBlanks(char *text) noexcept;

}  // namespace cli
