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

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "calendar/calendar.hpp"

namespace cli {

namespace detail {
// The common shapes, read without measuring or trimming: "yyyy-mm-dd"
// and the 26-byte timestamp "yyyy-mm-dd-hh.mm.ss.ffffff" or
// "yyyy-mm-dd hh:mm:ss.ffffff", with nothing behind them.  The bytes are
// tested in order, so the terminator stops the test before anything past
// it is read.  They accept only what the general scans accept, with the
// same fields; anything else, a failure included, goes to the general scan,
// which also writes the failure's fields and trims as it always does.
constexpr std::uint32_t digitAt(const char *t, std::size_t i) noexcept {
  return static_cast<std::uint32_t>(static_cast<unsigned char>(t[i]) - unsigned{'0'});
}

constexpr bool digitsAt(const char *t, std::size_t from, std::size_t to) noexcept {
  for (std::size_t i = from; i < to; ++i) {
    if (digitAt(t, i) > 9) return false;
  }
  return true;
}

struct Fields {
  std::int32_t year, month, day;
};

// The ten bytes of a date at the head of the text, valid as a date.
[[gnu::always_inline]] inline bool headDate(const char *t, Fields &f) noexcept {
  if (!digitsAt(t, 0, 4) || t[4] != '-' || !digitsAt(t, 5, 7) || t[7] != '-' ||
      !digitsAt(t, 8, 10)) {
    return false;
  }
  const auto two = [t](std::size_t i) { return digitAt(t, i) * 10 + digitAt(t, i + 1); };
  const std::uint32_t year = two(0) * 100 + two(2), month = two(5), day = two(8);
  if (year == 0 || month - 1 > 11 || day == 0) return false;
  // Every month has 28 days; only the few days beyond look up the month.
  if (day > 28) {
    const auto leap = CLI_isLeapYear(static_cast<std::int32_t>(year));
    if (day > static_cast<std::uint32_t>(CLI_monthLengthTable[leap][month])) return false;
  }
  f = {static_cast<std::int32_t>(year), static_cast<std::int32_t>(month),
       static_cast<std::int32_t>(day)};
  return true;
}

struct Clock {
  std::int32_t hour, minute, second;
};

// The 15 bytes "hh.mm.ss.ffffff" behind a date's separator, the points
// after a hyphen or the colons after a blank, and then the terminator.
[[gnu::always_inline]] inline bool tailTime(const char *t, Clock &c) noexcept {
  const char separator = t[-1] == '-' ? '.' : t[-1] == ' ' ? ':' : '\0';
  if (separator == '\0' || !digitsAt(t, 0, 2) || t[2] != separator || !digitsAt(t, 3, 5) ||
      t[5] != separator || !digitsAt(t, 6, 8) || t[8] != '.' || !digitsAt(t, 9, 15) ||
      t[15] != '\0') {
    return false;
  }
  const auto two = [t](std::size_t i) {
    return static_cast<std::int32_t>(digitAt(t, i) * 10 + digitAt(t, i + 1));
  };
  c = {two(0), two(3), two(6)};
  if (c.hour > 24 || c.minute > 59 || c.second > 59) return false;
  if (c.hour == 24 && (c.minute != 0 || c.second != 0 || std::memcmp(t + 9, "000000", 6) != 0)) {
    return false;
  }
  return true;
}

// Whether the general scan would end the date after its ten bytes without
// trimming anything: at the terminator, or at a separator in a text of at
// most 32 bytes that does not end in a blank.  What follows is not read.
[[gnu::always_inline]] inline bool dateEnds(const char *t) noexcept {
  if (t[10] == '\0') return true;
  if (t[10] != '-' && t[10] != ' ') return false;
  const std::size_t length = 11 + std::strlen(t + 11);
  return length <= 32 && t[length - 1] != ' ';
}

inline void storeDate(const Fields &f, std::int32_t *year, std::int32_t *month,
                      std::int32_t *day) noexcept {
  *year = f.year;
  *month = f.month;
  *day = f.day;
}

// The general scans, for every text that is not of a common shape.
std::int32_t scanDateText(char *text, std::int32_t *year, std::int32_t *month, std::int32_t *day,
                          std::int32_t *hour, std::int32_t *minute, std::int32_t *second,
                          char *code) noexcept;
std::int32_t scanDatePart(char *text, std::int32_t *year, std::int32_t *month,
                          std::int32_t *day) noexcept;

}  // namespace detail

// Reads a date or a timestamp and validates all of it.  Returns 1, or 0
// with "04" (the date, or the length) or "06" (the time of day) in `code`.
// hour, minute and second may be null; they are written only on success.
// Inline, so that each routine reads the common shapes without a call.
[[gnu::always_inline]] inline std::int32_t CLI_parseDateText(
    char *text, std::int32_t *year, std::int32_t *month, std::int32_t *day, std::int32_t *hour,
    std::int32_t *minute, std::int32_t *second, char *code) noexcept {
  detail::Fields f{};
  detail::Clock c{0, 0, 0};
  if (detail::headDate(text, f) && (text[10] == '\0' || detail::tailTime(text + 11, c))) {
    detail::storeDate(f, year, month, day);
    if (hour != nullptr) *hour = c.hour;
    if (minute != nullptr) *minute = c.minute;
    if (second != nullptr) *second = c.second;
    return 1;
  }
  return detail::scanDateText(text, year, month, day, hour, minute, second, code);
}

// Reads the date at the head of the text; what stands behind a separator
// is not read.  Returns 1 or 0.
[[gnu::always_inline]] inline std::int32_t CLI_parseDatePart(char *text, std::int32_t *year,
                                                             std::int32_t *month,
                                                             std::int32_t *day) noexcept {
  detail::Fields f{};
  if (detail::headDate(text, f) && detail::dateEnds(text)) {
    detail::storeDate(f, year, month, day);
    return 1;
  }
  return detail::scanDatePart(text, year, month, day);
}

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
