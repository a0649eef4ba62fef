// TIMESTAMPDIFF: a timestamp duration, written as one decimal number whose
// digits from the right are seconds, minutes, hours, days, months and
// years (yyyymmddhhmmss.ffffff), as a count of one unit.  There is no
// calendar here: a month counts 30 days, a year 365, and whatever is finer
// than the unit is dropped.
#include <cstdint>
#include <cstring>

#include "frame/frame.hpp"
#include "routines.hpp"

namespace {

using cli::Sysfun;

// The interval codes: the unit that the duration is counted in.
enum Interval : std::int32_t {
  kMicroseconds = 1,
  kSeconds = 2,
  kMinutes = 4,
  kHours = 8,
  kDays = 16,
  kWeeks = 32,
  kMonths = 64,
  kQuarters = 128,
  kYears = 256,
};

constexpr std::int64_t kMax = 2147483647;

struct Duration {
  bool negative = false;
  std::int64_t years = 0, months = 0, days = 0, hours = 0, minutes = 0, seconds = 0, micros = 0;
};

constexpr bool isDigit(char c) { return c >= '0' && c <= '9'; }

// Reads the duration text without changing it.  Returns 0 or the code
// (07 a byte that is not allowed, 10 too many digits on either side).
Sysfun read(const char *text, Duration &out) noexcept {
  std::size_t length = std::strlen(text);
  while (length > 1 && text[length - 1] == ' ') --length;  // the first byte stays
  std::size_t start = 0;
  if (length > 0 && (text[0] == '-' || text[0] == '+')) {
    out.negative = text[0] == '-';
    start = 1;
  }
  std::size_t point = length;
  for (std::size_t i = start; i < length; ++i) {
    if (text[i] == '.' && point == length) {
      point = i;
    } else if (!isDigit(text[i])) {
      return Sysfun::badDuration;
    }
  }
  if (point - start > 14) return Sysfun::tooLong;
  const std::size_t fraction = point < length ? length - point - 1 : 0;
  if (fraction > 6) return Sysfun::tooLong;

  // yyyymmddhhmmss, right-aligned: the field ending `fromRight` digits
  // before the point, `width` digits wide.
  const auto field = [&](std::size_t fromRight, std::size_t width) {
    std::int64_t v = 0;
    for (std::size_t k = fromRight + width; k > fromRight; --k) {
      const std::size_t digits = point - start;
      v = v * 10 + (k <= digits ? text[point - k] - '0' : 0);
    }
    return v;
  };
  out.seconds = field(0, 2);
  out.minutes = field(2, 2);
  out.hours = field(4, 2);
  out.days = field(6, 2);
  out.months = field(8, 2);
  out.years = field(10, 4);
  for (std::size_t k = 0; k < 6; ++k) {
    out.micros = out.micros * 10 + (k < fraction ? text[point + 1 + k] - '0' : 0);
  }
  return Sysfun::none;
}

// The duration in the unit of `code`, or 0 with `failure` set.
std::int64_t convert(std::int32_t code, const Duration &t, Sysfun &failure) noexcept {
  const std::int64_t totalMinutes =
      t.years * 525600 + t.months * 43200 + t.days * 1440 + t.hours * 60 + t.minutes;
  switch (code) {
    case kMicroseconds: {
      if (totalMinutes > (kMax - t.seconds) / 60) break;
      const std::int64_t totalSeconds = t.seconds + totalMinutes * 60;
      if (totalSeconds > (kMax - t.micros) / 1000000) break;
      return t.micros + totalSeconds * 1000000;
    }
    case kSeconds:
      if (totalMinutes > (kMax - t.seconds) / 60) break;
      return t.seconds + totalMinutes * 60;
    case kMinutes:
      // Minutes have no overflow test and no failure: from a year field of
      // 4086 on the total passes 32 bits, and what is stored is the total
      // kept in 32 bits, two's complement, the same on every platform.
      return static_cast<std::int32_t>(static_cast<std::uint32_t>(totalMinutes));
    case kHours:
      return t.years * 8760 + t.months * 720 + t.days * 24 + t.hours;
    case kDays:
      return t.years * 365 + t.months * 30 + t.days;
    case kWeeks:
      return t.years * 52 + (t.months * 30 + t.days) / 7;
    case kMonths:
      return t.years * 12 + t.months;
    case kQuarters:
      return t.years * 4 + t.months / 3;
    case kYears:
      return t.years;
    default:
      failure = Sysfun::badInterval;
      return 0;
  }
  failure = Sysfun::overflow;
  return 0;
}

}  // namespace

namespace cli {

Answer<std::int32_t> routine::TIMESTAMPDIFF(std::int32_t interval, TextIn duration) noexcept {
  Duration t;
  if (const Sysfun bad = read(duration.chars(), t); bad != Sysfun::none) {
    return failure<std::int32_t>(bad);
  }
  Sysfun failed = Sysfun::none;
  const std::int64_t value = convert(interval, t, failed);
  if (failed != Sysfun::none) return failure<std::int32_t>(failed);
  return success(
      static_cast<std::int32_t>(static_cast<std::uint32_t>(t.negative ? -value : value)));
}

}  // namespace cli
