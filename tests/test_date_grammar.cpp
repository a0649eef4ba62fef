// The grammar of date, time and timestamp text: tables by position, and a
// small model of the grammar held against the parsers on mutated texts.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <optional>
#include <random>
#include <string>
#include <string_view>

#include "support/frame_call.hpp"

namespace {

using namespace orv::test;
using namespace std::chrono;
// Grammar, through JULIAN_DAY: the form that validates the whole text
// gives 04 or 06, the form that reads only the date 04 or the number.
TEST(DateGrammar, AcceptsAndRefusesByPosition) {
  struct Case {
    const char *text;
    const char *whole;  // "" when valid, else the code of JULIAN_DAY2
    const char *head;   // the same for JULIAN_DAY1
  };
  const Case cases[] = {
      {"2000-01-01", "", ""},
      {"2001-1-5", "", ""},
      {"2001-01-5", "", ""},
      {"2001-01-0000000005", "", ""},
      {"2000-01-01    ", "", ""},
      {"2000-02-29", "", ""},
      {"1900-02-29", "04", "04"},
      {"2100-02-29", "04", "04"},
      {"0001-01-01", "", ""},
      {"9999-12-31", "", ""},
      {"0000-01-01", "04", "04"},
      {" 2000-01-01", "04", "04"},
      {"2000-1-1-1", "06", ""},
      {"2000-00-10", "04", "04"},
      {"2000-01-32", "04", "04"},
      {"2000-04-31", "04", "04"},
      {"2000/01/01", "04", "04"},
      {"20000-1-01", "04", "04"},
      {"2000-100-1", "04", "04"},
      {"2000-1--01", "04", "04"},
      {"2000-01-01-", "06", ""},
      {"2000-01-01-24.00.00", "", ""},
      {"2000-01-01-24.00.01", "06", ""},
      {"2000-01-01 13.30.15", "06", ""},
      {"2000-01-01-13:30:15", "06", ""},
      {"2000-01-01 13:30:15.5", "", ""},
      {"2000-01-01-13.30.15.123456789012", "", ""},
      {"2000-01-01-13.30.15.1234567890123", "04", "04"},  // 33 bytes
      {"2000-01-01-25.00.00", "06", ""},
      {"2000-13-01-25.00.00", "04", "04"},
      {"2000-01-01xjunk", "04", "04"},
      {"2000-01-01 junk", "06", ""},
      {"2001-01-4294967301", "04", "04"},  // a day that wraps to 5 in 32 bits
      {"2001-01- 12.30.00", "04", "04"},   // an empty day before a blank
      {"2001-01--12.30.00", "04", "04"},
      {"", "04", "04"},
      {"        ", "04", "04"},
  };
  for (const Case &c : cases) {
    for (const auto &[routine, code] :
         {std::pair{"CLI_udfJULIAN_DAY2", c.whole}, std::pair{"CLI_udfJULIAN_DAY1", c.head}}) {
      const Outcome got = call(routine, {text(c.text)}, intArea());
      EXPECT_EQ(got.error, code) << routine << " on '" << c.text << "'";
    }
  }
}

TEST(TimeGrammar, ReadsHoursMinutesSecondsInTimeMode) {
  struct Case {
    const char *text;
    std::int64_t seconds;  // -5 when refused
  };
  const Case cases[] = {
      {"00.00.00", 0},     {"23.59.59", 86399},
      {"24.00.00", 86400}, {"12.30", 45000},
      {"12:30:15", 45015}, {"12.30.15", 45015},
      {"0012.30", 45000},  {".30.00", 1800},
      {"1.30", 5400},      {"12.30.15          ", 45015},
      {"24.00.01", -5},    {"24.01.00", -5},
      {"25.00.00", -5},    {"12.60.00", -5},
      {"12.00.60", -5},    {"1:2:3", -5},
      {"12.30:15", -5},    {"12:30.15", -5},
      {"12.345", -5},      {"12.30.15.5", -5},
      {"123", -5},         {"123456789", -5},
      {"12-30-15", -5},    {"", -5},
  };
  for (const Case &c : cases) {
    const Outcome want = c.seconds < 0 ? fails("05") : ok(c.seconds);
    EXPECT_EQ(call("CLI_udfMIDNIGHT_SECONDS1", {text(c.text)}, intArea()), want) << c.text;
  }
  // Nine bytes or more are a date or timestamp to the second form.
  EXPECT_EQ(call("CLI_udfMIDNIGHT_SECONDS2", {text("2001-01-05-13.30.15.5")}, intArea()),
            ok(std::int64_t{48615}));
  EXPECT_EQ(call("CLI_udfMIDNIGHT_SECONDS2", {text("2001-01-05 ")}, intArea()),
            ok(std::int64_t{0}));
  EXPECT_EQ(call("CLI_udfMIDNIGHT_SECONDS2", {text("2001-1-5")}, intArea()), fails("05"));
  EXPECT_EQ(call("CLI_udfMIDNIGHT_SECONDS2", {text("12.30.15.5")}, intArea()), fails("04"));
  EXPECT_EQ(call("CLI_udfMIDNIGHT_SECONDS2", {text("2001-01-05-13.30")}, intArea()), fails("06"));
}

// A small model of the grammar, written from its description rather than
// from the scans: fields are found by their separators.
namespace model {

using Text = std::string_view;

bool digit(char c) { return c >= '0' && c <= '9'; }
bool digits(Text t) { return std::all_of(t.begin(), t.end(), digit); }
std::int64_t value(Text t) {  // saturated, as no field may wrap
  std::int64_t v = 0;
  for (char c : t) v = std::min<std::int64_t>(v * 10 + (c - '0'), std::int64_t{1} << 40);
  return v;
}
Text trimmed(Text t) {
  while (!t.empty() && t.back() == ' ') t.remove_suffix(1);
  return t;
}

struct Clock {
  std::int64_t h = 0, m = 0, s = 0;
};

// hh.mm[.ss] or hh:mm[:ss] (the hour may be long or empty), and in a
// timestamp a fraction of up to 12 digits; 24 only as midnight.
std::optional<Clock> time(Text t, bool inStamp, char dateSeparator) {
  if (t.size() < 4 || t.size() > 21 || (inStamp ? t.size() < 7 : t.size() > 8)) return {};
  const std::size_t k = t.find_first_of(".:");
  if (k == Text::npos || !digits(t.substr(0, k))) return {};
  const char sep = t[k];
  if (inStamp && dateSeparator != (sep == '.' ? '-' : ' ')) return {};
  Clock c{value(t.substr(0, k)), 0, 0};
  const Text rest = t.substr(k + 1);
  if (rest.size() < 2 || !digits(rest.substr(0, 2))) return {};
  c.m = value(rest.substr(0, 2));
  Text fraction;
  if (rest.size() > 2) {
    if (rest.size() < 5 || rest[2] != sep || !digits(rest.substr(3, 2))) return {};
    c.s = value(rest.substr(3, 2));
    if (rest.size() > 5) {
      fraction = rest.substr(6);
      if (!inStamp || rest[5] != '.' || fraction.size() > 12 || !digits(fraction)) return {};
    }
  }
  if (c.h > 24 || c.m > 59 || c.s > 59) return {};
  if (c.h == 24 && (c.m != 0 || c.s != 0 || fraction.find_first_not_of('0') != Text::npos)) {
    return {};
  }
  return c;
}

struct Date {
  sys_days day;
  std::size_t end;  // where the date's digits stop
};

// yyyy-m[m]-d..., the day's digits ending the text or followed by a hyphen
// or blank at position 8, 9 or 10.
std::optional<Date> date(Text t) {
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
  const year_month_day ymd{year{static_cast<int>(y)}, month{static_cast<unsigned>(m)},
                           day{static_cast<unsigned>(d)}};
  if (!ymd.ok()) return {};
  return Date{sys_days{ymd}, end};
}

std::int64_t julian(sys_days d) { return d.time_since_epoch().count() + 2440588; }
std::int64_t seconds(const Clock &c) { return c.h * 3600 + c.m * 60 + c.s; }

// The outcomes of JULIAN_DAY1 and 2 and MIDNIGHT_SECONDS1 and 2.
Outcome julianOfPart(Text raw) {
  const auto d = date(trimmed(raw));
  return d ? ok(julian(d->day)) : fails("04");
}
std::optional<Clock> stampTime(Text t, const Date &d) {
  if (d.end == t.size()) return Clock{};
  return time(t.substr(d.end + 1), true, t[d.end]);
}
Outcome julianOfText(Text raw) {
  const Text t = trimmed(raw);
  const auto d = date(t);
  if (!d) return fails("04");
  return stampTime(t, *d) ? ok(julian(d->day)) : fails("06");
}
Outcome secondsOfTime(Text raw) {
  const auto c = time(trimmed(raw), false, 0);
  return c ? ok(seconds(*c)) : fails("05");
}
Outcome secondsOfAny(Text raw) {
  const Text t = trimmed(raw);
  if (t.size() < 9) return secondsOfTime(t);
  const auto d = date(t);
  if (!d) return fails("04");
  const auto c = stampTime(t, *d);
  return c ? ok(seconds(*c)) : fails("06");
}

}  // namespace model

// Valid texts of every shape, then a few bytes replaced, inserted or
// removed: each routine agrees with the model, success or code.
TEST(DateGrammar, AgreesWithAModelOnMutatedTexts) {
  std::mt19937_64 rng(20261123);
  const auto pick = [&](std::uint64_t n) { return rng() % n; };
  // Appends v in at least `width` digits.
  const auto put = [](std::string &out, std::uint64_t v, std::uint64_t width) {
    char digits[24];
    const int n = std::snprintf(digits, sizeof digits, "%0*llu", static_cast<int>(width),
                                static_cast<unsigned long long>(v));
    out.append(digits, static_cast<std::size_t>(n));
  };
  const char alphabet[] = "0123456789-. :x";
  const struct {
    const char *routine;
    Outcome (*expected)(model::Text);
  } routines[] = {{"CLI_udfJULIAN_DAY2", model::julianOfText},
                  {"CLI_udfJULIAN_DAY1", model::julianOfPart},
                  {"CLI_udfMIDNIGHT_SECONDS1", model::secondsOfTime},
                  {"CLI_udfMIDNIGHT_SECONDS2", model::secondsOfAny}};
  int failures = 0;
  for (int n = 0; n < 40000; ++n) {
    const char sep = pick(2) == 0 ? '.' : ':';
    std::string t;
    const bool withDate = pick(4) != 0;
    if (withDate) {
      put(t, pick(10000), 4);
      t += '-';
      put(t, 1 + pick(12), 1 + pick(2));
      t += '-';
      put(t, 1 + pick(31), 1 + pick(3));
    }
    if (!withDate || pick(2) == 0) {
      if (withDate) t += sep == '.' ? '-' : ' ';
      put(t, pick(26), 1 + pick(2));
      t += sep;
      put(t, pick(61), 2);
      if (pick(3) != 0) {
        t += sep;
        put(t, pick(61), 2);
        if (pick(3) == 0) {
          t += '.';
          put(t, 0, pick(14));
        }
      }
    }
    t += std::string(pick(3), ' ');
    for (std::uint64_t k = pick(4); k > 0 && !t.empty(); --k) {
      const std::size_t at = pick(t.size());
      const char c = alphabet[pick(sizeof alphabet - 1)];
      switch (pick(3)) {
        case 0:
          t[at] = c;
          break;
        case 1:
          t.insert(at, 1, c);
          break;
        default:
          t.erase(at, 1);
      }
    }
    for (const auto &r : routines) {
      const Outcome got = call(r.routine, {text(t)}, intArea());
      if (got != r.expected(t) && ++failures <= 10) {
        ADD_FAILURE() << r.routine << " on '" << t << "': " << testing::PrintToString(got);
      }
    }
  }
  EXPECT_EQ(failures, 0);
}

// The date routines cut trailing blanks in the caller's buffer.

}  // namespace
