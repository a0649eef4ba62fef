// TIMESTAMP, TIMESTAMPDATE and TIMESTAMPTIME: timestamp text built from a
// date, a time or both.  Nothing is re-spelled: the text is validated and
// joined to fixed text or to today's date, so its fields stay as the caller
// wrote them.  The result area holds 27 bytes, and no path writes more.
#include <cstdint>
#include <cstring>
#include <ctime>

#include "calendar/parse.hpp"
#include "frame/frame.hpp"
#include "routines.hpp"

namespace {

using cli::Report;
using cli::Sysfun;

constexpr char kMidnight[] = "-00.00.00.000000";
constexpr char kNoFraction[] = ".000000";

// Writes today's date in Coordinated Universal Time as "yyyy-mm-dd-".
// The clock is read once per call.
char *writeToday(char *out) noexcept {
  const std::tm parts = cli::platform::utcNow();
  const auto put = [&](int value, int digits) {
    for (int i = digits - 1; i >= 0; --i, value /= 10) out[i] = static_cast<char>('0' + value % 10);
    out += digits;
  };
  put(parts.tm_year + 1900, 4);
  *out++ = '-';
  put(parts.tm_mon + 1, 2);
  *out++ = '-';
  put(parts.tm_mday, 2);
  *out++ = '-';
  return out;
}

char *append(char *out, const char *text, std::size_t length) noexcept {
  std::memcpy(out, text, length);
  return out + length;
}

// A time on today's date; 05 when the text is no time.
Report stampTime(char *text, char *result) noexcept {
  if (cli::CLI_parseTimeText(cli::kTimeMode, text, nullptr, nullptr, nullptr) == 0) {
    return Sysfun::badTime;
  }
  char *out = writeToday(result);
  out = append(out, text, std::strlen(text));
  std::memcpy(out, kNoFraction, sizeof kNoFraction);
  return {};
}

// A date at midnight; 04 when the text is no date, and also for a date
// text longer than 10 bytes, which would not fit the 27-byte result.
Report stampDate(char *text, char *result) noexcept {
  std::int32_t y = 0, m = 0, d = 0;
  if (cli::CLI_parseDatePart(text, &y, &m, &d) == 0) return Sysfun::badDate;
  const std::size_t length = std::strlen(text);
  if (length > 10) return Sysfun::badDate;
  std::memcpy(append(result, text, length), kMidnight, sizeof kMidnight);
  return {};
}

}  // namespace

namespace cli {

Report routine::TIMESTAMPTIME(WritableTextIn time, TextOut result) noexcept {
  return stampTime(time.chars(), result.chars());
}

Report routine::TIMESTAMPDATE(WritableTextIn date, TextOut result) noexcept {
  return stampDate(date.chars(), result.chars());
}

// By its form: longer than 10 bytes a timestamp, copied up to the result's
// 26 bytes (a longer fraction is cut); otherwise a date when it holds a
// hyphen, a time when it has 8 bytes, and nothing that is taken else.
Report routine::TIMESTAMP(WritableTextIn value, TextOut result) noexcept {
  char *text = value.chars();
  const std::size_t length = CLI_trimBlanks(text);
  if (length > 10) {
    std::int32_t y = 0, m = 0, d = 0;
    char code[3];
    if (CLI_parseDateText(text, &y, &m, &d, nullptr, nullptr, nullptr, code) == 0) {
      return sysfunOf(code);
    }
    const std::size_t stamp = result.limit();
    const std::size_t kept = length < stamp ? length : stamp;
    std::memcpy(result.chars(), text, kept);
    std::memset(result.chars() + kept, 0, stamp + 1 - kept);
    return {};
  }
  if (std::memchr(text, '-', length) != nullptr) return stampDate(text, result.chars());
  if (length == 8) return stampTime(text, result.chars());
  return Sysfun::badTimestamp;
}

}  // namespace cli
