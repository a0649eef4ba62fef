// POWER: x to the power y.  Three forms rest on pow and differ in what they
// test around it; the 64-bit form multiplies step by step with an exact
// overflow test.  The forms disagree at the edges on purpose: 0 to the
// power 0 is 1 except in the 64-bit form, and a negative exponent gives a
// rounded fraction in the 32-bit form and 0 in the 64-bit form.
#include <cmath>
#include <cstdint>

#include "numeric/answer.hpp"

namespace {

using cli::Answer;
using cli::CLI_isOutOfRange;
using cli::failure;
using cli::failureAfterStoring;
using cli::success;
using cli::Sysfun;

// The double forms store pow's value before testing it, so an overflow
// leaves the infinity and an underflow the zero in the result area.
Answer<double> powerOfDoubles(double x, double y) {
  if (x == 0.0 && 0.0 > y) return failure<double>(Sysfun::outOfRange);
  // A NaN y compares equal to nothing, so it fails here for a negative x.
  if (0.0 > x && !(y == std::floor(y))) return failure<double>(Sysfun::outOfRange);
  const double r = std::pow(x, y);
  if (CLI_isOutOfRange(r)) return failureAfterStoring(r, Sysfun::overflow);
  if (r == 0.0 && !(x == 0.0)) return failureAfterStoring(r, Sysfun::overflow);
  return success(r);
}

Answer<double> powerOfDoubleToInt(double x, std::int32_t y) {
  return powerOfDoubles(x, static_cast<double>(y));
}

// Rounded half away from zero, and tested after the half is added: the
// results run from -2147483647 to 2147483646.
Answer<std::int32_t> powerOfInt32(std::int32_t x, std::int32_t y) {
  const double dx = x, dy = y;
  if (x == 0 && y < 0) return failure<std::int32_t>(Sysfun::outOfRange);
  const double r = std::pow(dx, dy);
  if (CLI_isOutOfRange(r)) return failure<std::int32_t>(Sysfun::overflow);
  if (r == 0.0 && x != 0) return failure<std::int32_t>(Sysfun::overflow);
  const double v = r >= 0.0 ? r + 0.5 : r + (-0.5);
  if (-2147483648.0 > v || v > 2147483647.0) return failure<std::int32_t>(Sysfun::overflow);
  return success(static_cast<std::int32_t>(v));
}

// Exact, and the same as multiplying by x y - 1 times with each product
// tested: for |x| >= 2 every partial product is smaller in magnitude than
// the last, so one overflows exactly when x^y does not fit.  That lets the
// power be formed by squaring, in at most 6 squarings and 6 products, each
// tested.  x = -1 never overflows; its sign follows the parity of y.
constexpr Answer<std::int64_t> powerOfInt64(std::int64_t x, std::int64_t y) {
  if (x == 0) return y > 0 ? success(std::int64_t{0}) : failure<std::int64_t>(Sysfun::outOfRange);
  if (y == 0 || x == 1) return success(std::int64_t{1});
  if (y < 0) return success(std::int64_t{0});
  if (x == -1) return success(std::int64_t{y % 2 == 0 ? 1 : -1});
  if (y >= 64) return failure<std::int64_t>(Sysfun::overflow);  // |x|^64 >= 2^64
  std::int64_t result = 1;
  std::int64_t square = x;
  for (;;) {
    if ((y & 1) != 0 && __builtin_mul_overflow(result, square, &result)) {
      return failure<std::int64_t>(Sysfun::overflow);
    }
    y >>= 1;
    if (y == 0) return success(result);
    if (__builtin_mul_overflow(square, square, &square)) {
      return failure<std::int64_t>(Sysfun::overflow);
    }
  }
}

static_assert(powerOfInt64(-2, 63).value == -9223372036854775807 - 1);
static_assert(powerOfInt64(2, 63).code == Sysfun::overflow);
static_assert(powerOfInt64(3, 39).value == 4052555153018976267);
static_assert(powerOfInt64(3, 40).code == Sysfun::overflow);

}  // namespace

namespace cli {

Answer<double> routine::POWER1(double x, double y) noexcept { return powerOfDoubles(x, y); }
Answer<double> routine::POWER2(double x, std::int32_t y) noexcept {
  return powerOfDoubleToInt(x, y);
}
Answer<std::int32_t> routine::POWER3(std::int32_t x, std::int32_t y) noexcept {
  return powerOfInt32(x, y);
}
Answer<std::int64_t> routine::POWER4(std::int64_t x, std::int64_t y) noexcept {
  return powerOfInt64(x, y);
}

}  // namespace cli
