// The grammar of date, time and timestamp text: JULIAN_DAY and
// MIDNIGHT_SECONDS against a small model of it (tests/models/date_text.hpp),
// on texts at the edges of the grammar and on valid texts of every shape
// with a few bytes changed.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <random>
#include <string>
#include <string_view>

#include "models/date_text.hpp"
#include "support/frame_call.hpp"

namespace {

using namespace orv::test;
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
  const struct {
    const char *routine;
    dt::Answer (*expected)(dt::Text);
  } routines[] = {{"CLI_udfJULIAN_DAY2", dt::julianDayOfText},
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
    }
    for (const auto &r : routines) {
      const dt::Answer want = r.expected(t);
      const Outcome got = call(r.routine, {text(t)}, intArea());
      if (got != (want.code.empty() ? ok(want.value) : fails(want.code)) && ++failures <= 10) {
        ADD_FAILURE() << r.routine << " on '" << t << "': " << testing::PrintToString(got);
      }
    }
  }
  EXPECT_EQ(failures, 0);
}

}  // namespace
