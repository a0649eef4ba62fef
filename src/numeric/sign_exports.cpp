// ABS, SIGN, CEILING, FLOOR and MOD, each family one template over the
// value type with the exports as its instantiations.  Of these only the
// most negative value under ABS and a zero divisor under MOD fail.
#include <cmath>
#include <cstdint>
#include <limits>

#include "numeric/answer.hpp"

namespace {

using cli::Answer;
using cli::failure;
using cli::success;
using cli::Sysfun;

// The integer forms: the most negative value has no absolute value in its
// own width, and raises 01 in every width rather than standing for itself.
template <typename T>
constexpr Answer<T> absOf(T x) {
  if (x == std::numeric_limits<T>::min()) return failure<T>(Sysfun::outOfRange);
  return success(static_cast<T>(x < 0 ? -x : x));
}

// The sign bit cleared, with no comparison: -0.0 gives +0.0 and a NaN keeps
// its payload.
Answer<double> absOfDouble(double x) { return success(std::fabs(x)); }

// Zero first, then negative, then positive; a NaN fails both tests and is
// positive.  Zero of either sign gives +0.0.
template <typename T>
constexpr Answer<T> signOf(T x) {
  if (x == T{0}) return success(T{0});
  if (T{0} > x) return success(T{-1});
  return success(T{1});
}

Answer<double> ceilingOfDouble(double x) { return success(std::ceil(x)); }
Answer<double> floorOfDouble(double x) { return success(std::floor(x)); }

// Every integer is whole: the integer forms of CEILING and FLOOR give their
// input, and the 64-bit one never goes near a double.
template <typename T>
constexpr Answer<T> whole(T x) {
  return success(x);
}

// The remainder with the sign of the dividend.  A divisor of -1 gives 0
// without dividing, since the most negative value over -1 has no quotient
// in its width.  The narrow forms work in 32 bits, as x - (x / y) * y.
template <typename T, Sysfun zeroDivisor>
constexpr Answer<T> remainderOf(T x, T y) {
  if (y == 0) return failure<T>(zeroDivisor);
  if (y == -1) return success(T{0});
  if constexpr (sizeof(T) <= sizeof(std::int32_t)) {
    const std::int32_t a = x, b = y;
    return success(static_cast<T>(a - (a / b) * b));
  } else {
    return success(static_cast<T>(x % y));
  }
}

static_assert(absOf<std::int16_t>(-32767).value == 32767);
static_assert(remainderOf<std::int64_t, Sysfun::overflow>(-7, 3).value == -1);

}  // namespace

namespace cli {

Answer<double> routine::ABS1(double x) noexcept { return absOfDouble(x); }
Answer<std::int32_t> routine::ABS2(std::int32_t x) noexcept { return absOf<std::int32_t>(x); }
Answer<std::int16_t> routine::ABS3(std::int16_t x) noexcept { return absOf<std::int16_t>(x); }
Answer<std::int64_t> routine::ABS4(std::int64_t x) noexcept { return absOf<std::int64_t>(x); }

Answer<double> routine::SIGN1(double x) noexcept { return signOf<double>(x); }
Answer<std::int32_t> routine::SIGN2(std::int32_t x) noexcept { return signOf<std::int32_t>(x); }
Answer<std::int16_t> routine::SIGN3(std::int16_t x) noexcept { return signOf<std::int16_t>(x); }
Answer<std::int64_t> routine::SIGN4(std::int64_t x) noexcept { return signOf<std::int64_t>(x); }

Answer<double> routine::CEILING1(double x) noexcept { return ceilingOfDouble(x); }
Answer<std::int32_t> routine::CEILING2(std::int32_t x) noexcept { return whole<std::int32_t>(x); }
Answer<std::int16_t> routine::CEILING3(std::int16_t x) noexcept { return whole<std::int16_t>(x); }
Answer<std::int64_t> routine::CEILING4(std::int64_t x) noexcept { return whole<std::int64_t>(x); }

Answer<double> routine::FLOOR1(double x) noexcept { return floorOfDouble(x); }
Answer<std::int32_t> routine::FLOOR2(std::int32_t x) noexcept { return whole<std::int32_t>(x); }
Answer<std::int16_t> routine::FLOOR3(std::int16_t x) noexcept { return whole<std::int16_t>(x); }
Answer<std::int64_t> routine::FLOOR4(std::int64_t x) noexcept { return whole<std::int64_t>(x); }

// A zero divisor is 02 in the 32-bit form and 03 in the other two.
Answer<std::int32_t> routine::MOD1(std::int32_t x, std::int32_t y) noexcept {
  return remainderOf<std::int32_t, Sysfun::divisionByZero>(x, y);
}
Answer<std::int16_t> routine::MOD2(std::int16_t x, std::int16_t y) noexcept {
  return remainderOf<std::int16_t, Sysfun::overflow>(x, y);
}
Answer<std::int64_t> routine::MOD3(std::int64_t x, std::int64_t y) noexcept {
  return remainderOf<std::int64_t, Sysfun::overflow>(x, y);
}

}  // namespace cli
