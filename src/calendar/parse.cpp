#include "calendar/parse.hpp"

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "calendar/calendar.hpp"

namespace cli {
namespace {

constexpr bool isDigit(char c) noexcept { return c >= '0' && c <= '9'; }

// The value of the digits from `p` on.  Every field reaches here as digits
// only, as the scans check, so this reads what atol would; it saturates
// instead of wrapping, so that no run of digits can pass for a small value.
std::int64_t readNumber(const char *p) noexcept {
  constexpr std::int64_t kCeiling = std::int64_t{1} << 40;
  std::int64_t value = 0;
  for (; isDigit(*p); ++p) {
    value = value * 10 + (*p - '0');
    if (value > kCeiling) value = kCeiling;
  }
  return value;
}

// Stores a field as read, clamped into 32 bits; callers test the 64-bit value.
std::int64_t storeField(std::int32_t *out, std::int64_t value) noexcept {
  *out = value > INT32_MAX ? INT32_MAX : static_cast<std::int32_t>(value);
  return value;
}

void store(std::int32_t *out, std::int32_t value) noexcept {
  if (out != nullptr) *out = value;
}

std::int32_t fail(char *code, const char *why) noexcept {
  std::memcpy(code, why, 3);
  return 0;
}

// The scan shared by both date parsers: the date and where it ends.
struct DateScan {
  std::size_t length = 0;  // of the text, after trimming
  std::size_t end = 0;     // the end of the date: the end of the text, or its separator
};

std::int32_t scanDate(char *text, std::int32_t *year, std::int32_t *month, std::int32_t *day,
                      DateScan &scan) noexcept {
  const std::size_t length = CLI_trimBlanks(text);
  scan.length = length;
  if (length < 8 || length > 32) return 0;

  bool monthSeen = false;
  std::size_t dayStart = 0;
  std::size_t i = 0;
  for (;;) {
    if ((i == 8 || i == 9 || i == 10) && (text[i] == '-' || text[i] == ' ')) break;
    if (!isDigit(text[i])) return 0;
    if (++i == length) break;
    if (i == 4) {
      if (text[4] != '-') return 0;
      const std::int64_t y = storeField(year, readNumber(text));
      if (y < 1 || y > 9999) return 0;
      i = 5;
    }
    bool ended = false;
    while ((i == 6 || i == 7) && text[i] == '-') {
      if (monthSeen) return 0;
      monthSeen = true;
      const std::int64_t m = storeField(month, readNumber(text + 5));
      if (m < 1 || m > 12) return 0;
      dayStart = i + 1;
      i = dayStart;
      if (i == length) {
        ended = true;
        break;
      }
    }
    if (ended) break;
  }
  scan.end = i;
  if (!monthSeen) return 0;
  // An empty day field is refused whatever follows it, also a blank that
  // would otherwise let the hour's digits pass for the day.
  if (dayStart == scan.end) return 0;
  const std::int64_t d = storeField(day, readNumber(text + dayStart));
  return d >= 1 && d <= CLI_monthLengthTable[CLI_isLeapYear(*year)][*month] ? 1 : 0;
}

}  // namespace

std::size_t CLI_trimBlanks(char *text) noexcept {
  std::size_t length = std::strlen(text);
  const std::size_t full = length;
  while (length > 0 && text[length - 1] == ' ') --length;
  if (length != full) text[length] = '\0';
  return length;
}

std::int32_t detail::scanDatePart(char *text, std::int32_t *year, std::int32_t *month,
                                  std::int32_t *day) noexcept {
  DateScan scan;
  return scanDate(text, year, month, day, scan);
}

std::int32_t detail::scanDateText(char *text, std::int32_t *year, std::int32_t *month,
                                  std::int32_t *day, std::int32_t *hour, std::int32_t *minute,
                                  std::int32_t *second, char *code) noexcept {
  DateScan scan;
  if (scanDate(text, year, month, day, scan) == 0) return fail(code, "04");
  if (scan.end == scan.length) {
    store(hour, 0);
    store(minute, 0);
    store(second, 0);
    return 1;
  }
  if (CLI_parseTimeText(kTimestampMode, text + scan.end + 1, hour, minute, second) == 0) {
    return fail(code, "06");
  }
  return 1;
}

std::int32_t CLI_parseTimeText(std::uint32_t mode, char *text, std::int32_t *hour,
                               std::int32_t *minute, std::int32_t *second) noexcept {
  const std::size_t length = CLI_trimBlanks(text);
  if (length < 4 || length > 21) return 0;
  if (mode == kTimestampMode ? length < 7 : length > 8) return 0;

  std::size_t m = 0;  // where the minutes start: the position behind the first separator
  char separator = 0;
  for (std::size_t i = 0; i < length; ++i) {
    if (text[i] == '.' || text[i] == ':') {
      separator = text[i];
      m = i + 1;
      break;
    }
    if (!isDigit(text[i])) return 0;
  }
  if (separator == 0) return 0;
  if (mode == kTimestampMode && text[-1] != (separator == '.' ? '-' : ' ')) return 0;

  const std::int64_t h = readNumber(text);
  if (h > 24) return 0;
  if (!isDigit(text[m]) || !isDigit(text[m + 1])) return 0;
  const std::int64_t mi = readNumber(text + m);
  if (mi > 59) return 0;

  std::int64_t s = 0;
  bool fractionIsZero = true;
  if (length > m + 2) {
    if (text[m + 2] != separator) return 0;
    if (!isDigit(text[m + 3]) || !isDigit(text[m + 4])) return 0;
    s = readNumber(text + m + 3);
    if (s > 59) return 0;
    if (length != m + 5) {
      if (mode == kTimeMode || text[m + 5] != '.') return 0;
      const std::size_t first = m + 6;
      if (length - first > 12) return 0;
      for (std::size_t i = first; i < length; ++i) {
        if (!isDigit(text[i])) return 0;
        fractionIsZero = fractionIsZero && text[i] == '0';
      }
    }
  }
  if (h == 24 && (mi != 0 || s != 0 || !fractionIsZero)) return 0;

  store(hour, static_cast<std::int32_t>(h));
  store(minute, static_cast<std::int32_t>(mi));
  store(second, static_cast<std::int32_t>(s));
  return 1;
}

}  // namespace cli
