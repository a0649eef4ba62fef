// Date and time routines: every date of the calendar against a model built
// on <chrono> (tests/models/calendar.hpp), and the calendar's date of each
// day number against <chrono>'s; trimming, timestamps and durations, and
// the grammar of the texts: JULIAN_DAY and MIDNIGHT_SECONDS against a small
// model of it (tests/models/date_text.hpp), on texts at the edges of the
// grammar and on valid texts of every shape with a few bytes changed.
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <list>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "calendar/calendar.hpp"
#include "catalogue/catalogue.hpp"
#include "frame/table_call.hpp"
#include "models/calendar.hpp"
#include "models/date_text.hpp"
#include "models/duration.hpp"
#include "support/frame_call.hpp"

namespace {

using namespace orv::test;
using namespace std::chrono;
using Numbers = orv::model::DateNumbers;  // what a date gives, from <chrono> alone

// Writes the date as text: full width, or month and day without leading
// zeros, with a time of day (or anything else) behind it.
void spell(char *out, const year_month_day &ymd, bool shortFields, const char *time) {
  const auto two = [&](unsigned v, bool full) {
    if (full || v >= 10) *out++ = static_cast<char>('0' + v / 10);
    *out++ = static_cast<char>('0' + v % 10);
  };
  const auto y = static_cast<unsigned>(static_cast<int>(ymd.year()));
  two(y / 100, true);
  two(y % 100, true);
  *out++ = '-';
  two(static_cast<unsigned>(ymd.month()), !shortFields);
  *out++ = '-';
  two(static_cast<unsigned>(ymd.day()), !shortFields);
  std::memcpy(out, time, std::strlen(time) + 1);
}

// Both exports of each routine, one of which reads only the date at the
// head of the text, are held against the date's numbers from <chrono>.
// Each is laid out once over the same text, and the loop only changes
// what the text holds.
TEST(DateNumbers, AgreeWithChronoOnEveryDateOfTheCalendar) {
  const std::pair<const char *, std::int32_t Numbers::*> routines[] = {
      {"JULIAN_DAY", &Numbers::julian},         {"WEEK", &Numbers::week},
      {"WEEK_ISO", &Numbers::isoWeek},          {"QUARTER", &Numbers::quarter},
      {"DAYOFYEAR", &Numbers::ordinal},         {"DAYOFWEEK", &Numbers::dayOfWeek},
      {"DAYOFWEEK_ISO", &Numbers::isoDayOfWeek}};
  char text[40];
  std::list<cli::call::TableCall> calls;
  for (const auto &[name, expected] : routines) {
    for (const cli::catalogue::Routine &row : cli::catalogue::kRoutines) {
      if (std::string_view(row.sqlName) != name) continue;
      calls.emplace_back(row, exportAddress(row.symbol)).setInput(0, text);
    }
  }
  ASSERT_EQ(calls.size(), 14U);
  // Each date in full width, in short fields and with a time of day behind
  // it; trailing blanks on some.  The time must not change the number.
  const char *times[] = {"", "-23.59.59.999999", " 12:30:15", "   "};
  int failures = 0;
  const sys_days first = sys_days{year{1} / January / 1};
  for (sys_days day = first; day <= sys_days{year{9999} / December / 31}; day += days{1}) {
    const Numbers want = orv::model::numbersOf(day);
    // The calendar's own way back from a day number, which the hosts use.
    const year_month_day ymd{day};
    const cli::CLI_date date =
        cli::CLI_dateOfDayNumber(static_cast<std::int32_t>((day - first).count() + 1));
    if (date != cli::CLI_date{static_cast<int>(ymd.year()),
                              static_cast<int>(static_cast<unsigned>(ymd.month())),
                              static_cast<int>(static_cast<unsigned>(ymd.day()))} &&
        ++failures <= 10) {
      ADD_FAILURE() << "CLI_dateOfDayNumber of " << (day - first).count() + 1 << ": " << date.year
                    << "-" << date.month << "-" << date.day;
    }
    const auto n = static_cast<unsigned>(day.time_since_epoch().count());
    unsigned k = 0;
    for (cli::call::TableCall &c : calls) {
      const std::int32_t expected = want.*routines[k / 2].second;
      spell(text, year_month_day{day}, ((n + k / 2) & 1) != 0, times[(n + k / 2 + k % 2) % 4]);
      c.step(CLI_CALL_FETCH);
      if ((c.number(0) != expected || c.status().stored()) && ++failures <= 10) {
        ADD_FAILURE() << c.row().symbol << " on " << text << ": " << c.number(0) << ", want "
                      << expected << " " << c.status().message;
      }
      ++k;
    }
  }
  EXPECT_EQ(failures, 0);
}

TEST(DateText, IsTrimmedInTheCallersBuffer) {
  for (const char *input : {"2001-12-31  ", "2001-13-31  "}) {
    char buffer[16] = {};
    std::memcpy(buffer, input, std::strlen(input) + 1);
    call("CLI_udfWEEK2", {placedAt(buffer)});
    EXPECT_EQ(std::string(buffer, 12), std::string(input, 10) + std::string("\0 ", 2)) << input;
  }
  // TIMESTAMPDIFF reads its duration as it stands and leaves it so.
  char duration[] = "1.5  ";
  EXPECT_EQ(call("CLI_udfTIMESTAMPDIFF", {i32(2), placedAt(duration)}).number, 1);
  EXPECT_EQ(std::string(duration, sizeof duration), std::string("1.5  ", sizeof duration));
}

// A time alone takes today's date, read before and after the calls: should
// the day change between the two, the calls are made once more.
TEST(Timestamp, JoinsTheTextAsWrittenWithMidnightOrToday) {
  const auto today = [] {
    char stamp[12];
    spell(stamp, year_month_day{floor<days>(system_clock::now())}, false, "-");
    return std::string(stamp);
  };
  for (;;) {
    const std::string t = today();
    const struct {
      const char *routine, *input;
      Outcome expected;
    } cases[] = {
        {"CLI_udfTIMESTAMP", "2001-01-05", ok("2001-01-05-00.00.00.000000")},
        {"CLI_udfTIMESTAMP", "2001-1-5  ", ok("2001-1-5-00.00.00.000000")},
        {"CLI_udfTIMESTAMP", "13.30.15", ok(t + "13.30.15.000000")},
        {"CLI_udfTIMESTAMP", "13:30:15", ok(t + "13:30:15.000000")},
        {"CLI_udfTIMESTAMP", "2001-01-05 13:30:15", ok("2001-01-05 13:30:15")},
        {"CLI_udfTIMESTAMP", "2001-01-05-13.30.15.123456789", ok("2001-01-05-13.30.15.123456")},
        {"CLI_udfTIMESTAMP", "2001-1-5-1", ok("2001-1-5-1-00.00.00.000000")},
        {"CLI_udfTIMESTAMP", "12.30", fails("06")},
        {"CLI_udfTIMESTAMP", "1234567890", fails("06")},
        {"CLI_udfTIMESTAMP", "   ", fails("06")},
        {"CLI_udfTIMESTAMP", "25.00.00", fails("05")},
        {"CLI_udfTIMESTAMP", "2001-13-5", fails("04")},
        {"CLI_udfTIMESTAMP", "2001-01-05-25.00.00", fails("06")},
        {"CLI_udfTIMESTAMP", "2001-02-30-12.00.00", fails("04")},
        {"CLI_udfTIMESTAMPTIME", "1.30", ok(t + "1.30.000000")},
        {"CLI_udfTIMESTAMPTIME", "24.00.00 ", ok(t + "24.00.00.000000")},
        {"CLI_udfTIMESTAMPTIME", "2001-01-05", fails("05")},
        {"CLI_udfTIMESTAMPDATE", "2001-01-05 ", ok("2001-01-05-00.00.00.000000")},
        {"CLI_udfTIMESTAMPDATE", "13.30.15", fails("04")},
        // A date text that passes the parser but would not fit the result.
        {"CLI_udfTIMESTAMPDATE", "2001-01-05-13.30.15.123456789012", fails("04")},
        {"CLI_udfTIMESTAMPDATE", "2001-01-0000000000000000000005", fails("04")},
    };
    std::vector<Outcome> got;
    for (const auto &c : cases) got.push_back(call(c.routine, {text(c.input)}));
    if (today() != t) continue;
    for (std::size_t i = 0; i < got.size(); ++i) {
      EXPECT_EQ(got[i], cases[i].expected) << cases[i].routine << " on '" << cases[i].input << "'";
    }
    break;
  }
}

Outcome durationModel(std::int32_t code, const std::string &text) {
  const orv::model::Duration want = orv::model::timestampDiff(code, text);
  return want.code.empty() ? ok(want.value) : fails(want.code);
}

// A few durations worked out by hand pin the model down: a ratio of each
// kind, the sign, the limits of the 32-bit result, minutes that wrap, an
// interval code that is no power of two; random durations do the rest.
TEST(TimestampDiff, ConvertsDurationsByFixedRatios) {
  const struct {
    std::int32_t code;
    const char *duration;
    Outcome expected;
  } cases[] = {
      // clang-format off
    {8, "10000", ok(1)},                 {32, "100000000", ok(4)},      {16, "1200000000", ok(360)},
    {16, "10000000000", ok(365)},        {1, "1.5", ok(1500000)},       {2, "-100", ok(-60)},
    {1, "3547.483647", ok(2147483647)},  {1, "3547.483648", fails("03")},
    {2, "680105031407", ok(2147483647)}, {2, "680105031408", fails("03")},
    {2, "   ", fails("07")},             {3, "", fails("08")},
    {4, "-40860000000000", ok(4294967296 - 2147601600)},
    {4, "99991231235959", ok(5256038879 - 4294967296)},
      // clang-format on
  };
  for (const auto &c : cases) {
    EXPECT_EQ(call("CLI_udfTIMESTAMPDIFF", {i32(c.code), text(c.duration)}), c.expected)
        << c.code << " '" << c.duration << "'";
    EXPECT_EQ(durationModel(c.code, c.duration), c.expected) << "model on '" << c.duration << "'";
  }
  // Random durations near and past the limits of every code.
  std::mt19937 random(1122);
  const std::string alphabet = "0123456789000000009.+- ";
  for (int round = 0; round < 20000; ++round) {
    std::string d(std::uniform_int_distribution<std::size_t>(0, 22)(random), '0');
    for (char &c : d) c = alphabet[std::uniform_int_distribution<std::size_t>(0, 22)(random)];
    const std::int32_t code = 1 << std::uniform_int_distribution<int>(0, 9)(random);
    const Outcome got = call("CLI_udfTIMESTAMPDIFF", {i32(code), text(d)});
    ASSERT_EQ(got, durationModel(code, d)) << code << " '" << d << "'";
  }
}

namespace dt = orv::model::date_text;

// Texts that random ones seldom are: the limits of each field and of the
// whole, leap days, midnight as 24, fractions of 12 and 13 digits, a day
// that wraps in 32 bits, blanks before and between, empty and blank texts;
// separated by '|'.
constexpr std::string_view kEdges =
    "0001-01-01|9999-12-31|0000-01-01|2000-00-10|2000-01-32|1900-02-29|2100-02-29|2000-02-29|"
    " 2000-01-01|2000-01-01    |        ||2001-01-0000000005|2000-1-1-1|2000-01-01-|2000/01/01|"
    "20000-1-01|2000-100-1|2000-1--01|2000-01-01xjunk|2000-01-01 junk|2001-01-4294967301|"
    "2001-01- 12.30.00|2001-01--12.30.00|2000-01-01-24.00.00|2000-01-01-24.00.01|"
    "2000-01-01 13.30.15|2000-01-01-13:30:15|2000-01-01 13:30:15.5|"
    "2000-01-01-13.30.15.123456789012|2000-01-01-13.30.15.1234567890123|2000-13-01-25.00.00|"
    "2001-01-05-13.30.15.5|2001-01-05 |2001-01-05-13.30|24.00.00|24.00.01|24.01.00|0012.30|"
    ".30.00|12.30.15          |1:2:3|12.30:15|12:30.15|12.345|12.30.15.5|123|123456789|"
    "12-30-15";

// Then valid texts of every shape with a few bytes replaced, inserted or
// removed: each routine agrees with the model, success or code.
TEST(DateGrammar, AgreesWithAModelOnEdgesAndMutatedTexts) {
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
  const std::pair<const char *, dt::Answer (*)(dt::Text)> routines[] = {
      {"CLI_udfJULIAN_DAY2", dt::julianDayOfText},
      {"CLI_udfJULIAN_DAY1", dt::julianDayOfHead},
      {"CLI_udfMIDNIGHT_SECONDS1", dt::secondsOfTime},
      {"CLI_udfMIDNIGHT_SECONDS2", dt::secondsOfAny}};
  int failures = 0;
  for (std::size_t from = 0, n = 0; n < 40000; ++n) {
    std::string t;
    if (from <= kEdges.size()) {  // the edges first
      const std::size_t bar = std::min(kEdges.find('|', from), kEdges.size());
      t = kEdges.substr(from, bar - from);
      from = bar + 1;
    } else {
      const char sep = pick(2) == 0 ? '.' : ':';
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
        const auto how = pick(3);
        if (how == 0) t[at] = c;
        if (how == 1) t.insert(at, 1, c);
        if (how == 2) t.erase(at, 1);
      }
    }
    for (const auto &[routine, model] : routines) {
      const dt::Answer want = model(t);
      const Outcome got = call(routine, {text(t)});
      if (got != (want.code.empty() ? ok(want.value) : fails(want.code)) && ++failures <= 10) {
        ADD_FAILURE() << routine << " on '" << t << "': " << testing::PrintToString(got);
      }
    }
  }
  EXPECT_EQ(failures, 0);
}

}  // namespace
