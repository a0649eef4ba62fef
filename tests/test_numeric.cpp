// Numeric routines: the 64-bit forms against exact 128-bit arithmetic, the
// double and 32-bit forms of ROUND and TRUNCATE against exact integer
// arithmetic on values where the doubles are exact, the edges that random
// inputs don't reach as a table, and RAND: its sequence repeats per seed
// and is seeded once per statement, and its values are multiples of
// 1/32767 in [0, 1].
#include <gtest/gtest.h>

#include <array>
#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>
#include <random>
#include <vector>

#include "frame/cliudf.h"
#include "models/integers.hpp"
#include "support/frame_call.hpp"

namespace {

using namespace orv::test;
using orv::model::Int128;

constexpr std::int64_t kMin64 = std::numeric_limits<std::int64_t>::min();
constexpr std::int64_t kMax64 = std::numeric_limits<std::int64_t>::max();
constexpr std::int32_t kMin32 = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t kMax32 = std::numeric_limits<std::int32_t>::max();
const double kInf = HUGE_VAL;
const double kNaN = std::numeric_limits<double>::quiet_NaN();
const double kTiny = std::numeric_limits<double>::denorm_min();

bool isNaN(const Outcome &o) { return o.real && std::isnan(std::bit_cast<double>(o.number)); }

Outcome run(const std::string &routine, const std::vector<Value> &in) {
  return call(("CLI_udf" + routine).c_str(), in);
}

// What the random tests below don't reach: the limits of each width,
// signed zeros, infinities and NaNs, exact ties, the digit counts where
// ROUND and TRUNCATE give up, and the domain of each elementary function.
// A NaN expected from a maths function matches any NaN: its sign and
// payload are the C library's business.  The routines' own bits are
// compared exactly (ABS1's cleared sign bit has its own test).
TEST(NumericRoutines, KeepTheirEdges) {
  const struct {
    const char *routine;
    std::vector<Value> in;
    Outcome want;
  } cases[] = {
      // clang-format off
    {"ABS4", {i64(-kMax64)}, ok(kMax64)},            {"ABS4", {i64(kMin64)}, fails("01")},
    {"ABS2", {i32(kMin32)}, fails("01")},            {"ABS2", {i32(-kMax32)}, ok(kMax32)},
    {"ABS3", {i16(-32768)}, fails("01")},            {"ABS3", {i16(-32767)}, ok(32767)},
    {"ABS1", {f64(-0.0)}, okReal(0.0)},              {"SIGN1", {f64(-0.0)}, okReal(0.0)},
    {"SIGN1", {f64(kNaN)}, okReal(1.0)},             {"SIGN1", {f64(-kInf)}, okReal(-1.0)},
    {"SIGN1", {f64(kTiny)}, okReal(1.0)},            {"SIGN2", {i32(kMin32)}, ok(-1)},
    {"SIGN3", {i16(-32768)}, ok(-1)},                {"MOD1", {i32(kMin32), i32(-1)}, ok(0)},
    {"MOD2", {i16(-32768), i16(-1)}, ok(0)},         {"MOD1", {i32(7), i32(0)}, fails("02")},
    {"MOD2", {i16(7), i16(0)}, fails("03")},         {"MOD2", {i16(-7), i16(3)}, ok(-1)},
    {"MOD1", {i32(7), i32(-3)}, ok(1)},              {"MOD2", {i16(-32768), i16(32767)}, ok(-1)},
    {"FLOOR1", {f64(-0.5)}, okReal(-1.0)},           {"CEILING1", {f64(-0.5)}, okReal(-0.0)},
    {"CEILING1", {f64(kNaN)}, okReal(kNaN)},         {"FLOOR1", {f64(-kInf)}, okReal(-kInf)},
    {"FLOOR4", {i64(9007199254740993)}, ok(9007199254740993)},
    {"CEILING2", {i32(kMin32)}, ok(kMin32)},         {"FLOOR2", {i32(kMax32)}, ok(kMax32)},
    {"CEILING3", {i16(-32768)}, ok(-32768)},         {"ROUND1", {f64(0.125), i32(2)}, okReal(0.12)},
    {"ROUND1", {f64(1.0), i32(323)}, okReal(1.0)},   {"ROUND1", {f64(1.0), i32(324)}, fails("03")},
    {"ROUND1", {f64(1.0), i32(-308)}, okReal(0.0)},  {"ROUND1", {f64(1.0), i32(-309)}, fails("03")},
    {"ROUND1", {f64(1.0), i32(kMin32)}, fails("03")},
    {"ROUND1", {f64(1.7976931348623157e308), i32(-308)}, okReal(kInf)},
    {"ROUND1", {f64(kInf), i32(0)}, okReal(kNaN)},
    {"TRUNCATE1", {f64(2.0), i32(308)}, okReal(kInf)},
    {"TRUNCATE1", {f64(1.5), i32(309)}, fails("03")},
    {"TRUNCATE1", {f64(-kInf), i32(3)}, okReal(-kInf)},
    {"ROUND2", {i32(7), i32(-308)}, ok(0)},          {"ROUND2", {i32(7), i32(-309)}, fails("03")},
    {"ROUND2", {i32(kMax32), i32(-1)}, fails("03")},
    {"ROUND2", {i32(kMin32), i32(-3)}, fails("03")},
    {"TRUNCATE2", {i32(kMin32), i32(-1)}, ok(-2147483640)},
    {"TRUNCATE2", {i32(kMax32), i32(-10)}, ok(0)},
    {"TRUNCATE2", {i32(5), i32(-309)}, fails("03")}, {"POWER1", {f64(0.0), f64(0.0)}, okReal(1.0)},
    {"POWER1", {f64(kNaN), f64(0.0)}, okReal(1.0)},
    {"POWER1", {f64(-0.0), f64(-1.0)}, fails("01")},
    {"POWER1", {f64(-2.0), f64(kNaN)}, fails("01")},
    {"POWER1", {f64(-10.0), f64(309.0)}, failsStoring("03", -kInf)},
    {"POWER1", {f64(10.0), f64(-400.0)}, failsStoring("03", 0.0)},
    {"POWER1", {f64(2.0), f64(-1074.0)}, okReal(kTiny)},
    {"POWER1", {f64(kInf), f64(-1.0)}, failsStoring("03", 0.0)},
    {"POWER1", {f64(-1.0), f64(kInf)}, okReal(1.0)},
    {"POWER2", {f64(-8.0), i32(3)}, okReal(-512.0)}, {"POWER2", {f64(0.0), i32(-1)}, fails("01")},
    {"POWER2", {f64(10.0), i32(kMin32)}, failsStoring("03", 0.0)},
    {"POWER3", {i32(2), i32(31)}, fails("03")},      {"POWER3", {i32(-2), i32(31)}, fails("03")},
    {"POWER3", {i32(46340), i32(2)}, ok(2147395600)},
    {"POWER3", {i32(kMax32), i32(1)}, fails("03")},
    {"POWER3", {i32(-kMax32), i32(1)}, ok(-kMax32)}, {"POWER3", {i32(2), i32(-1)}, ok(1)},
    {"POWER3", {i32(-2), i32(-1)}, ok(-1)},          {"POWER3", {i32(0), i32(0)}, ok(1)},
    {"POWER3", {i32(0), i32(-1)}, fails("01")},      {"POWER3", {i32(10), i32(-300)}, ok(0)},
    {"POWER3", {i32(10), i32(-400)}, fails("03")},   {"SQRT", {f64(-0.0)}, okReal(-0.0)},
    {"SQRT", {f64(-kTiny)}, fails("01")},            {"SQRT", {f64(kNaN)}, okReal(kNaN)},
    {"LOG", {f64(-0.0)}, fails("01")},               {"LOG10", {f64(0.0)}, fails("01")},
    {"LOG", {f64(kInf)}, okReal(kInf)},              {"LOG10", {f64(1000.0)}, okReal(3.0)},
    {"ASIN", {f64(-1.0)}, okReal(-std::asin(1.0))},  {"ACOS", {f64(1.0)}, okReal(0.0)},
    {"ACOS", {f64(1.0000000000000002)}, fails("01")},
    {"ASIN", {f64(-1.0000000000000002)}, fails("01")},
    {"EXP", {f64(710.0)}, failsStoring("03", kInf)},
    {"EXP", {f64(-746.0)}, failsStoring("03", 0.0)}, {"EXP", {f64(-745.13)}, okReal(kTiny)},
    {"EXP", {f64(-kInf)}, failsStoring("03", 0.0)},  {"EXP", {f64(kNaN)}, okReal(kNaN)},
    {"TAN", {f64(kInf)}, okReal(std::tan(kInf))},
    {"TAN", {f64(1.5707963267948966)}, okReal(1.633123935319537e16)},
    {"COT", {f64(-0.0)}, fails("02")},               {"COT", {f64(1e-310)}, okReal(kInf)},
    {"ATAN2", {f64(-0.0), f64(0.0)}, fails("02")},   {"ATAN2", {f64(0.0), f64(kNaN)}, okReal(kNaN)},
    {"ATAN2", {f64(-1.0), f64(0.0)}, okReal(3.141592653589793)},
    {"ATAN2", {f64(0.0), f64(-1.0)}, okReal(-1.5707963267948966)},
    {"ATAN", {f64(-kInf)}, okReal(-1.5707963267948966)},
    {"SIN", {f64(kInf)}, okReal(std::sin(kInf))},
    {"DEGREES1", {f64(3.141592653589793)}, okReal(180.0)},
    {"RADIANS1", {f64(180.0)}, okReal(3.141592653589793)},
    {"RADIANS1", {f64(3.0)}, okReal(0.05235987755982988)},
    {"DEGREES1", {f64(3e306)}, okReal(kInf)},
      // clang-format on
  };
  for (const auto &c : cases) {
    const Outcome got = run(c.routine, c.in);
    if (isNaN(c.want) && isNaN(got) && c.want.error == got.error) continue;
    EXPECT_EQ(got, c.want) << c.routine;
  }
}

TEST(NumericRoutines, AbsClearsTheSignBitOfANaN) {
  const Outcome got = run("ABS1", {f64(-kNaN)});
  EXPECT_TRUE(isNaN(got) && !std::signbit(std::bit_cast<double>(got.number)));
}

Outcome exact(const orv::model::Exact &e) { return e.code.empty() ? ok(e.value) : fails(e.code); }

Outcome modModel(std::int64_t x, std::int64_t y) {
  if (y == 0) return fails("03");
  return ok(static_cast<std::int64_t>(Int128{x} - Int128{x} / y * y));
}

// Integers with every count of digits, the limits and their neighbours.
std::int64_t anyInt64(std::mt19937_64 &rng) {
  switch (rng() % 4) {
    case 0:
      return static_cast<std::int64_t>(rng());
    case 1: {
      const std::int64_t edges[] = {kMin64, kMin64 + 1, kMax64, kMax64 - 1, 0, 1, -1, 5, -5};
      return edges[rng() % std::size(edges)];
    }
    default: {
      const auto digits = static_cast<int>(rng() % 19);
      const auto v =
          static_cast<std::int64_t>(rng() % static_cast<std::uint64_t>(orv::model::tenTo(digits)));
      return rng() % 2 ? v : -v;
    }
  }
}

TEST(SixtyFourBitForms, AgreeWithExactArithmetic) {
  std::mt19937_64 rng(4242);
  for (int i = 0; i < 20000; ++i) {
    const std::int64_t x = anyInt64(rng);
    const auto n = static_cast<std::int32_t>(static_cast<int>(rng() % 25) - 21);
    EXPECT_EQ(run("ROUND5", {i64(x), i32(n)}), exact(orv::model::round64(x, n)))
        << x << " at " << n;
    EXPECT_EQ(run("TRUNCATE5", {i64(x), i32(n)}), exact(orv::model::truncate64(x, n)));
    const std::int64_t y = rng() % 3 ? static_cast<std::int64_t>(rng() % 80) - 5 : anyInt64(rng);
    const std::int64_t base = rng() % 2 ? x : static_cast<std::int64_t>(rng() % 21) - 10;
    EXPECT_EQ(run("POWER4", {i64(base), i64(y)}), exact(orv::model::power64(base, y)))
        << base << " ** " << y;
    EXPECT_EQ(run("MOD3", {i64(x), i64(y)}), modModel(x, y));
  }
}

// The double and 32-bit forms of ROUND and TRUNCATE against exact integer
// arithmetic.  x is ±j / 2^d with j below 2^36: then x times a power of ten
// up to 10^5, x divided by one, and the sums the double ROUND forms are
// exact, and so is the cut at n <= 0, rounding half away from zero, with
// -0.0 where a negative x truncates to zero.  For n > 0 TRUNCATE1 gives the
// double nearest to the cut, and ROUND1, whose power 10^-n is inexact, one
// within four units in the last place, a half apart (where the inexact
// power decides) left out.  POWER1 is the C library's pow with its errors.
TEST(DoubleForms, AgreeWithExactArithmetic) {
  std::mt19937_64 rng(777);
  const auto nearest = [](Int128 v, std::int64_t k) {
    return k <= 0 ? static_cast<double>(v * orv::model::tenTo(-k))
                  : static_cast<double>(v) / static_cast<double>(orv::model::tenTo(k));
  };
  for (int i = 0; i < 20000; ++i) {
    const auto d = static_cast<int>(rng() % 11);
    const auto j = static_cast<std::int64_t>(rng() >> (28 + rng() % 36));
    const bool negative = rng() % 2 == 1 && j != 0;  // -0.0 has the sign factor +1
    const double x = std::ldexp(static_cast<double>(negative ? -j : j), -d);
    const auto n = static_cast<std::int32_t>(static_cast<int>(rng() % 12) - 6);
    // |x| * 10^n as num / den, cut and rounded in magnitude.
    const Int128 num = Int128{j} * orv::model::tenTo(std::max(n, 0)),
                 den = (Int128{1} << d) * orv::model::tenTo(std::max(-n, 0));
    const Int128 cut = num / den, rest = num % den, rounded = cut + (2 * rest >= den ? 1 : 0);
    const double sign = negative ? -1.0 : 1.0;
    EXPECT_EQ(run("TRUNCATE1", {f64(x), i32(n)}), okReal(sign * nearest(cut, n)))
        << x << " at " << n;
    const Outcome round = run("ROUND1", {f64(x), i32(n)});
    const double want = rounded == 0 ? 0.0 : sign * nearest(rounded, n);
    if (n <= 0) {
      EXPECT_EQ(round, okReal(want)) << x << " at " << n;
    } else if (2 * rest != den) {
      const auto got = std::bit_cast<double>(round.number);
      EXPECT_LE(std::fabs(got - want), 4 * std::fabs(std::nextafter(want, 0.0) - want))
          << x << " at " << n;
    }

    const std::int32_t xi = static_cast<std::int32_t>(rng()) >> (rng() % 32);
    const auto ni = static_cast<std::int32_t>(static_cast<int>(rng() % 15) - 12);
    const Int128 unit = orv::model::tenTo(std::max(-ni, 0)), magnitude = xi < 0 ? -Int128{xi} : xi;
    const Int128 kept = magnitude / unit * unit, up = 2 * (magnitude - kept) >= unit ? unit : 0;
    const Int128 rounded32 = (xi < 0 ? -1 : 1) * (kept + up);
    EXPECT_EQ(run("TRUNCATE2", {i32(xi), i32(ni)}),
              ok(static_cast<std::int64_t>((xi < 0 ? -1 : 1) * kept)));
    EXPECT_EQ(run("ROUND2", {i32(xi), i32(ni)}), rounded32 > kMax32 || rounded32 < kMin32
                                                     ? fails("03")
                                                     : ok(static_cast<std::int64_t>(rounded32)))
        << xi << " at " << ni;

    const double y = std::ldexp(static_cast<double>(static_cast<std::int64_t>(rng() >> 40)),
                                -static_cast<int>(rng() % 21)) *
                     (rng() % 2 == 1 ? -1.0 : 1.0);
    const double base = x * std::pow(10.0, static_cast<double>(rng() % 30) - 22.0);
    const double r = std::pow(base, y);
    const Outcome power =
        (base == 0.0 && 0.0 > y) || (0.0 > base && y != std::floor(y)) ? fails("01")
        : r == kInf || r == -kInf || (r == 0.0 && base != 0.0)         ? failsStoring("03", r)
                                                                       : okReal(r);
    EXPECT_EQ(run("POWER1", {f64(base), f64(y)}), power) << base << " ** " << y;
  }
}

// A draw of RAND1, or of RAND2 with its seed and the statement's
// scratchpad; NaN if the call fails.
double draw(const std::vector<Value> &seed = {}, void *scratchpad = nullptr) {
  const Outcome o = seed.empty()
                        ? call("CLI_udfRAND1", {})
                        : call("CLI_udfRAND2", seed, numberArea(Value::Layout::real), {scratchpad});
  return o.error.empty() ? std::bit_cast<double>(o.number) : kNaN;
}

TEST(Rand, RepeatsPerSeedAndSeedsOncePerStatement) {
  // A statement's draws: later seeds are ignored, and RAND1 goes on with
  // the same sequence.
  const auto sequence = [](std::int32_t seed, std::int32_t later) {
    std::array<unsigned char, 16> scratchpad{};
    std::vector<double> out{draw({i32(seed)}, scratchpad.data())};
    for (int i = 0; i < 5; ++i) out.push_back(draw({i32(later)}, scratchpad.data()));
    out.push_back(draw());
    EXPECT_EQ(scratchpad[CLI_SCRATCHPAD_DATA_OFFSET], 1);
    return out;
  };
  EXPECT_EQ(sequence(12345, 12345), sequence(12345, 999));
  EXPECT_NE(sequence(0, 0), sequence(-1, -1));
  EXPECT_EQ(sequence(0, 0), sequence(0, 7));
}

TEST(Rand, GivesMultiplesOfOneOver32767InTheClosedRange) {
  bool sawZero = false, sawOne = false;
  for (int i = 0; i < 400000; ++i) {
    const double r = draw();
    const double steps = r * 32767.0;
    ASSERT_TRUE(r >= 0.0 && r <= 1.0 && steps == std::round(steps)) << r;
    sawZero = sawZero || r == 0.0;
    sawOne = sawOne || r == 1.0;
  }
  EXPECT_TRUE(sawZero && sawOne);
}

}  // namespace
