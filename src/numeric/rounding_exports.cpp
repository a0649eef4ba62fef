// ROUND and TRUNCATE to n decimal places (n < 0: places left of the point).
//
// Each width has its own method.  The double and 32-bit forms work with a
// power of ten that pow returns, never one from a table, and evaluate every
// product and quotient in the grouping written here, which decides the last
// bits.  Negative values go through their magnitude and a sign factor, so
// that floor serves both signs.  The 64-bit forms use no floating point and
// strip decimal digits one at a time.
#include <cmath>
#include <cstdint>

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
double powerOfTen(std::int32_t n) { return std::pow(10.0, std::fabs(static_cast<double>(n))); }

// A half-way value goes away from zero.  Half-way is judged on m / p, with
// the inexact p of pow: 0.125 at n = 2 gives 0.12.
Answer<double> roundDouble(double x, std::int32_t n) {
  const double p = std::pow(10.0, -static_cast<double>(n));
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
  const double p = n >= 0 ? std::pow(10.0, static_cast<double>(n)) : powerOfTen(n);
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

// Strips -n digits; only the digit removed last decides the rounding, with
// no carry from the digits below it (1449 at n = -2 gives 1400).
Answer<std::int64_t> roundInt64(std::int64_t x, std::int32_t n) {
  if (n >= 0) return success(x);
  if (n < -19) return success(std::int64_t{0});
  // scale wraps harmlessly at the nineteenth digit: n = -19 never uses it.
  std::uint64_t scale = 1;
  std::int32_t i = 0;
  const std::int64_t g = x < 0 ? -1 : 1;
  std::int64_t d = 0;
  while (x != 0 && i > n) {
    d = x % 10;
    x /= 10;
    scale *= 10;
    --i;
  }
  if (i != n) return success(std::int64_t{0});
  if (d >= 5 || d <= -5) {
    if (n == -19) return failure<std::int64_t>(Sysfun::overflow);
    x += g;
    std::int64_t product = 0;
    if (__builtin_mul_overflow(static_cast<std::int64_t>(scale), x, &product)) {
      return failure<std::int64_t>(Sysfun::overflow);
    }
    return success(product);
  }
  if (n == -19) return success(std::int64_t{0});
  return success(static_cast<std::int64_t>(scale) * x);
}

Answer<std::int64_t> truncateInt64(std::int64_t x, std::int32_t n) {
  if (n >= 0) return success(x);
  if (n <= -19) return success(std::int64_t{0});
  std::int64_t scale = 1;
  for (std::int32_t i = 0; i > n && x != 0; --i) {
    x /= 10;
    scale *= 10;
  }
  return success(x * scale);
}

}  // namespace

CLI_NUMERIC_EXPORT2(CLI_udfROUND1, double, std::int32_t, double, roundDouble)
CLI_NUMERIC_EXPORT2(CLI_udfROUND2, std::int32_t, std::int32_t, std::int32_t, cutInt32<true>)
CLI_NUMERIC_EXPORT2(CLI_udfROUND5, std::int64_t, std::int32_t, std::int64_t, roundInt64)
CLI_NUMERIC_EXPORT2(CLI_udfTRUNCATE1, double, std::int32_t, double, truncateDouble)
CLI_NUMERIC_EXPORT2(CLI_udfTRUNCATE2, std::int32_t, std::int32_t, std::int32_t, cutInt32<false>)
CLI_NUMERIC_EXPORT2(CLI_udfTRUNCATE5, std::int64_t, std::int32_t, std::int64_t, truncateInt64)
