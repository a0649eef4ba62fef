// ROUND and TRUNCATE to n decimal places (n < 0: places left of the point).
//
// Each width has its own method.  The double and 32-bit forms work with a
// power of ten that pow returns (cli::platform::powerOfTen), never one from a
// table, and evaluate every
// product and quotient in the grouping written here, which decides the last
// bits.  Negative values go through their magnitude and a sign factor, so
// that floor serves both signs.  The 64-bit forms use no floating point and
// strip decimal digits with integer divisions.
#include <cmath>
#include <cstdint>
#include <utility>

#include "numeric/answer.hpp"

namespace {

using cli::Answer;
using cli::CLI_isOutOfRange;
using cli::failure;
using cli::success;
using cli::Sysfun;

constexpr double signFactor(double x) { return 0.0 > x ? -1.0 : 1.0; }

// 10 to the power |n|, with n converted to double before its sign is
// dropped, so that -2147483648 gives 2147483648.0.
double powerOfTen(std::int32_t n) {
  return cli::platform::powerOfTen(std::fabs(static_cast<double>(n)));
}

// A half-way value goes away from zero.  Half-way is judged on m / p, with
// the inexact p of pow: 0.125 at n = 2 gives 0.12.
Answer<double> roundDouble(double x, std::int32_t n) {
  const double p = cli::platform::powerOfTen(-static_cast<double>(n));
  if (CLI_isOutOfRange(p) || p == 0.0) return failure<double>(Sysfun::overflow);
  const double m = std::fmod(x, p);
  const double q = std::fabs(m / p);
  if (q >= 0.5 && m > 0) return success((p + x) - m);
  if (q >= 0.5) return success((x - p) - m);
  return success(x - m);
}

// The sign factor multiplies last, so a negative x that truncates to zero
// gives -0.0.
Answer<double> truncateDouble(double x, std::int32_t n) {
  const double s = signFactor(x);
  const double a = std::fabs(x);
  const double p = n >= 0 ? cli::platform::powerOfTen(static_cast<double>(n)) : powerOfTen(n);
  if (CLI_isOutOfRange(p)) return failure<double>(Sysfun::overflow);
  if (n >= 0) return success(s * (std::floor(a * p) / p));
  return success((std::floor(a / p) * p) * s);
}

// The 32-bit forms change only places left of the point.  A value rounded
// beyond the 32-bit range (2147483647 at n = -1 is 2147483650) raises 03
// instead of wrapping on the conversion.
template <bool rounding>
Answer<std::int32_t> cutInt32(std::int32_t x, std::int32_t n) {
  if (n >= 0) return success(x);
  const double s = signFactor(static_cast<double>(x));
  const double a = std::fabs(static_cast<double>(x));
  const double p = powerOfTen(n);
  if (CLI_isOutOfRange(p)) return failure<std::int32_t>(Sysfun::overflow);
  const double kept = rounding ? std::floor(a / p + 0.5) : std::floor(a / p);
  const double v = (kept * p) * s;
  if (v < -2147483648.0 || v > 2147483647.0) return failure<std::int32_t>(Sysfun::overflow);
  return success(static_cast<std::int32_t>(v));
}

// The 64-bit forms strip -n decimal digits.  Stripping them one at a time
// leaves x / 10^k, and the digit removed last is the one at place k; so
// each is found by one division by a power of ten, a constant for each k,
// which the compiler turns into a multiplication.
constexpr std::int64_t kPowersOfTen[19] = {1,
                                           10,
                                           100,
                                           1000,
                                           10000,
                                           100000,
                                           1000000,
                                           10000000,
                                           100000000,
                                           1000000000,
                                           10000000000,
                                           100000000000,
                                           1000000000000,
                                           10000000000000,
                                           100000000000000,
                                           1000000000000000,
                                           10000000000000000,
                                           100000000000000000,
                                           1000000000000000000};

// x / 10^k for k from 0 to 18, truncated towards zero.
template <int... K>
constexpr std::int64_t divide(std::int64_t x, int k, std::integer_sequence<int, K...>) {
  std::int64_t q = x;
  static_cast<void>(((k == K ? (q = x / kPowersOfTen[K], true) : false) || ...));
  return q;
}
constexpr std::int64_t dropDigits(std::int64_t x, int k) {
  return divide(x, k, std::make_integer_sequence<int, 19>{});
}

// Whether x has fewer than `digits` (0 to 18) decimal digits, so that
// stripping runs out before it has removed them all.
constexpr bool shorterThan(std::int64_t x, int digits) {
  const std::uint64_t magnitude =
      x < 0 ? 0 - static_cast<std::uint64_t>(x) : static_cast<std::uint64_t>(x);
  return magnitude < static_cast<std::uint64_t>(kPowersOfTen[digits]);
}

// Only the digit removed last decides the rounding, with no carry from the
// digits below it (1449 at n = -2 gives 1400).  At n = -19 no 64-bit value
// keeps a digit, and one that would round up does not fit.
constexpr Answer<std::int64_t> roundInt64(std::int64_t x, std::int32_t n) {
  if (n >= 0) return success(x);
  if (n < -19) return success(std::int64_t{0});
  const int k = -n;
  if (shorterThan(x, k - 1)) return success(std::int64_t{0});
  const std::int64_t head = dropDigits(x, k - 1);
  const std::int64_t last = head % 10;  // with the sign of x
  if (k == 19) {
    return last >= 5 || last <= -5 ? failure<std::int64_t>(Sysfun::overflow)
                                   : success(std::int64_t{0});
  }
  std::int64_t kept = head / 10;
  if (last >= 5 || last <= -5) kept += x < 0 ? -1 : 1;
  std::int64_t product = 0;
  if (__builtin_mul_overflow(kept, kPowersOfTen[k], &product)) {
    return failure<std::int64_t>(Sysfun::overflow);
  }
  return success(product);
}

constexpr Answer<std::int64_t> truncateInt64(std::int64_t x, std::int32_t n) {
  if (n >= 0) return success(x);
  if (n <= -19) return success(std::int64_t{0});
  return success(dropDigits(x, -n) * kPowersOfTen[-n]);
}

static_assert(roundInt64(1449, -2).value == 1400 && roundInt64(-1450, -2).value == -1500);
static_assert(roundInt64(7, -2).value == 0 && roundInt64(50, -2).value == 100);
static_assert(roundInt64(5000000000000000000, -19).code == Sysfun::overflow);
static_assert(truncateInt64(-9223372036854775807 - 1, -18).value == -9000000000000000000);

}  // namespace

namespace cli {

Answer<double> routine::ROUND1(double x, std::int32_t n) noexcept { return roundDouble(x, n); }
Answer<std::int32_t> routine::ROUND2(std::int32_t x, std::int32_t n) noexcept {
  return cutInt32<true>(x, n);
}
Answer<std::int64_t> routine::ROUND5(std::int64_t x, std::int32_t n) noexcept {
  return roundInt64(x, n);
}
Answer<double> routine::TRUNCATE1(double x, std::int32_t n) noexcept {
  return truncateDouble(x, n);
}
Answer<std::int32_t> routine::TRUNCATE2(std::int32_t x, std::int32_t n) noexcept {
  return cutInt32<false>(x, n);
}
Answer<std::int64_t> routine::TRUNCATE5(std::int64_t x, std::int32_t n) noexcept {
  return truncateInt64(x, n);
}

}  // namespace cli
