// The elementary functions: each a thin guard round one standard maths
// function, or a two-step formula.  What differs between them is what they
// test, whether before or after the call, whether the value is stored
// before the test, and the code.  Every test before a call is a comparison
// that a NaN makes false, so a NaN always reaches the function and comes
// back as a NaN with no status.
#include <cmath>

#include "numeric/answer.hpp"

namespace {

using cli::Answer;
using cli::CLI_isOutOfRange;
using cli::failure;
using cli::failureAfterStoring;
using cli::success;
using cli::Sysfun;

constexpr double kPi = 3.141592653589793115997963468544185161590576171875;  // 0x400921FB54442D18

Answer<double> sineOf(double x) { return success(std::sin(x)); }
Answer<double> cosineOf(double x) { return success(std::cos(x)); }
Answer<double> arcTangentOf(double x) { return success(std::atan(x)); }

// Stored first; a standard tan is finite for every finite x, so the test
// is a guard that does not fire.
Answer<double> tangentOf(double x) {
  const double r = std::tan(x);
  if (CLI_isOutOfRange(r)) return failureAfterStoring(r, Sysfun::outOfRange);
  return success(r);
}

// 1 / tan(x), with no test on the quotient: a subnormal x gives infinity.
Answer<double> cotangentOf(double x) {
  const double t = std::tan(x);
  if (t == 0.0) return failure<double>(Sysfun::divisionByZero);
  return success(1.0 / t);
}

Answer<double> arcSineOf(double x) {
  if (-1.0 > x || x > 1.0) return failure<double>(Sysfun::outOfRange);
  return success(std::asin(x));
}

Answer<double> arcCosineOf(double x) {
  if (-1.0 > x || x > 1.0) return failure<double>(Sysfun::outOfRange);
  return success(std::acos(x));
}

// a is the horizontal coordinate and b the vertical one: the reverse of
// the standard function's order.
Answer<double> arcTangentOfPair(double a, double b) {
  if (a == 0.0 && b == 0.0) return failure<double>(Sysfun::divisionByZero);
  return success(std::atan2(b, a));
}

Answer<double> logarithmOf(double x) {
  if (0.0 >= x) return failure<double>(Sysfun::outOfRange);
  return success(std::log(x));
}

Answer<double> decimalLogarithmOf(double x) {
  if (0.0 >= x) return failure<double>(Sysfun::outOfRange);
  return success(std::log10(x));
}

// Stored first; overflow and underflow to zero both raise 03, a subnormal
// result does not.
Answer<double> exponentialOf(double x) {
  const double r = std::exp(x);
  if (r == HUGE_VAL || r == 0.0) return failureAfterStoring(r, Sysfun::overflow);
  return success(r);
}

// -0.0 passes the test and gives -0.0.
Answer<double> squareRootOf(double x) {
  if (0.0 > x) return failure<double>(Sysfun::outOfRange);
  return success(std::sqrt(x));
}

// The product first, then the quotient: no ready-made ratio, whose
// rounding would differ (RADIANS(3.0) shows it).
Answer<double> degreesOf(double x) { return success((180.0 * x) / kPi); }
Answer<double> radiansOf(double x) { return success((kPi * x) / 180.0); }

}  // namespace

namespace cli {

Answer<double> routine::SIN(double x) noexcept { return sineOf(x); }
Answer<double> routine::COS(double x) noexcept { return cosineOf(x); }
Answer<double> routine::TAN(double x) noexcept { return tangentOf(x); }
Answer<double> routine::COT(double x) noexcept { return cotangentOf(x); }
Answer<double> routine::ASIN(double x) noexcept { return arcSineOf(x); }
Answer<double> routine::ACOS(double x) noexcept { return arcCosineOf(x); }
Answer<double> routine::ATAN(double x) noexcept { return arcTangentOf(x); }
Answer<double> routine::ATAN2(double a, double b) noexcept { return arcTangentOfPair(a, b); }
Answer<double> routine::LOG(double x) noexcept { return logarithmOf(x); }
Answer<double> routine::LOG10(double x) noexcept { return decimalLogarithmOf(x); }
Answer<double> routine::EXP(double x) noexcept { return exponentialOf(x); }
Answer<double> routine::SQRT(double x) noexcept { return squareRootOf(x); }
Answer<double> routine::DEGREES1(double x) noexcept { return degreesOf(x); }
Answer<double> routine::RADIANS1(double x) noexcept { return radiansOf(x); }

}  // namespace cli
