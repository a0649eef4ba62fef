// The grammar of date, time and timestamp text, written from its
// description rather than from the library's scans: fields are found by
// their separators.  It gives what JULIAN_DAY and MIDNIGHT_SECONDS give,
// for the unit tests and any fuzz target to compare the routines with.
#pragma once

#include <algorithm>
#include <chrono>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace orv::model::date_text {

struct Answer {
  std::string code;  // the SYSFUN code, empty on success
  std::int64_t value = 0;
};

using Text = std::string_view;
namespace chr = std::chrono;

inline bool digit(char c) { return c >= '0' && c <= '9'; }
inline bool digits(Text t) { return std::all_of(t.begin(), t.end(), digit); }
inline std::int64_t value(Text t) {  // saturated, as no field may wrap
  std::int64_t v = 0;
  for (char c : t) v = std::min<std::int64_t>(v * 10 + (c - '0'), std::int64_t{1} << 40);
  return v;
}
inline Text trimmed(Text t) {
  while (!t.empty() && t.back() == ' ') t.remove_suffix(1);
  return t;
}

// hh.mm[.ss] or hh:mm[:ss] (the hour may be long or empty), and in a
// timestamp a fraction of up to 12 digits; 24 only as midnight.  The
// seconds since midnight.
inline std::optional<std::int64_t> time(Text t, bool inStamp, char dateSeparator) {
  if (t.size() < 4 || t.size() > 21 || (inStamp ? t.size() < 7 : t.size() > 8)) return {};
  const std::size_t k = t.find_first_of(".:");
  if (k == Text::npos || !digits(t.substr(0, k))) return {};
  const char sep = t[k];
  if (inStamp && dateSeparator != (sep == '.' ? '-' : ' ')) return {};
  const std::int64_t h = value(t.substr(0, k));
  const Text rest = t.substr(k + 1);
  if (rest.size() < 2 || !digits(rest.substr(0, 2))) return {};
  const std::int64_t m = value(rest.substr(0, 2));
  std::int64_t s = 0;
  Text fraction;
  if (rest.size() > 2) {
    if (rest.size() < 5 || rest[2] != sep || !digits(rest.substr(3, 2))) return {};
    s = value(rest.substr(3, 2));
    if (rest.size() > 5) {
      fraction = rest.substr(6);
      if (!inStamp || rest[5] != '.' || fraction.size() > 12 || !digits(fraction)) return {};
    }
  }
  if (h > 24 || m > 59 || s > 59) return {};
  if (h == 24 && (m != 0 || s != 0 || fraction.find_first_not_of('0') != Text::npos)) return {};
  return h * 3600 + m * 60 + s;
}

struct Date {
  std::int64_t julian;
  std::size_t end;  // where the date's digits stop
};

// yyyy-m[m]-d..., the day's digits ending the text or followed by a hyphen
// or blank at position 8, 9 or 10.
inline std::optional<Date> date(Text t) {
  if (t.size() < 8 || t.size() > 32 || !digits(t.substr(0, 4)) || t[4] != '-') return {};
  const std::size_t monthEnd = t[6] == '-' ? 6 : 7;
  if (!digits(t.substr(5, monthEnd - 5)) || t[monthEnd] != '-') return {};
  const std::size_t dayStart = monthEnd + 1;
  std::size_t end = dayStart;
  while (end < t.size() && digit(t[end])) ++end;
  if (end == dayStart) return {};
  if (end < t.size() && (end < 8 || end > 10 || (t[end] != '-' && t[end] != ' '))) return {};
  const std::int64_t y = value(t.substr(0, 4)), m = value(t.substr(5, monthEnd - 5)),
                     d = value(t.substr(dayStart, end - dayStart));
  if (y < 1 || m < 1 || m > 12 || d < 1 || d > 31) return {};
  const chr::year_month_day ymd{chr::year{static_cast<int>(y)},
                                chr::month{static_cast<unsigned>(m)},
                                chr::day{static_cast<unsigned>(d)}};
  if (!ymd.ok()) return {};
  return Date{chr::sys_days{ymd}.time_since_epoch().count() + 2440588, end};
}

// The time behind a date, midnight if there is none.
inline std::optional<std::int64_t> stampTime(Text t, const Date &d) {
  if (d.end == t.size()) return 0;
  return time(t.substr(d.end + 1), true, t[d.end]);
}

// JULIAN_DAY1, which reads only the date at the head of the text.
inline Answer julianDayOfHead(Text raw) {
  const auto d = date(trimmed(raw));
  return d ? Answer{"", d->julian} : Answer{"04"};
}
// JULIAN_DAY2, which also validates a time behind the date.
inline Answer julianDayOfText(Text raw) {
  const Text t = trimmed(raw);
  const auto d = date(t);
  if (!d) return {"04"};
  return stampTime(t, *d) ? Answer{"", d->julian} : Answer{"06"};
}
// MIDNIGHT_SECONDS1: a time only.
inline Answer secondsOfTime(Text raw) {
  const auto s = time(trimmed(raw), false, 0);
  return s ? Answer{"", *s} : Answer{"05"};
}
// MIDNIGHT_SECONDS2: nine bytes or more are a date or timestamp.
inline Answer secondsOfAny(Text raw) {
  const Text t = trimmed(raw);
  if (t.size() < 9) return secondsOfTime(t);
  const auto d = date(t);
  if (!d) return {"04"};
  const auto s = stampTime(t, *d);
  return s ? Answer{"", *s} : Answer{"06"};
}

}  // namespace orv::model::date_text
