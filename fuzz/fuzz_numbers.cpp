// Numbers through every numeric routine: doubles and integers of each
// width from the bytes, and the rest of the bytes as number text.
//
// Input: x, y (two doubles), two 32-bit, two 16-bit and two 64-bit
// integers, a 32-bit digit count, then number text up to its first NUL.
// Beyond the frame's checks: the integer routines give the exact answer
// worked out in 128 bits (ROUND, TRUNCATE and the 64-bit POWER by the unit
// tests' models), the double routines that call the C maths library give
// its result bit for bit and, for a finite argument, no infinity on
// success, DOUBLETOCHAR's 24 bytes read back as the number, and
// CHARTODOUBLE gives what strtod gives for the text it accepts.
#include <array>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <numbers>
#include <string>
#include <string_view>
#include <tuple>

#include "harness.hpp"
#include "models/integers.hpp"

namespace {

using namespace orv::fuzz;
using I128 = orv::model::Int128;

std::uint64_t bits(double d) { return std::bit_cast<std::uint64_t>(d); }

bool sameDouble(double a, double b) {
  return bits(a) == bits(b) || (std::isnan(a) && std::isnan(b));
}

// A call with number inputs and one number result.  `store` allows a
// failure to leave a value behind.
template <typename R, typename... A>
std::string call(const char *name, R &out, bool store, A... in) {
  Call c(name);
  (c.input(numberBlock(in)), ...);
  c.result(Block(sizeof(R)));
  if (store) c.mayStoreOnFailure();
  std::string code = c.run();
  out = numberIn<R>(c.out());
  return code;
}

// A call whose outcome is exactly `want`.
template <typename R, typename... A>
void exactly(const char *name, const orv::model::Exact &want, A... in) {
  R r{};
  ORV_CHECK(name,
            call(name, r, false, in...) == want.code && (!want.code.empty() || r == want.value));
}

// ABS, SIGN, CEILING and FLOOR of an integer and MOD of two, exactly.
template <typename T>
void integers(const std::array<const char *, 5> &names, const char *modByZero, T x, T y) {
  using orv::model::Exact;
  const std::int64_t wide = x;
  exactly<T>(names[0], x == std::numeric_limits<T>::min() ? Exact{"01"} : Exact{"", std::abs(wide)},
             x);
  exactly<T>(names[1], Exact{"", (x > 0) - (x < 0)}, x);
  exactly<T>(names[2], Exact{"", x}, x);
  exactly<T>(names[3], Exact{"", x}, x);
  exactly<T>(names[4],
             y == 0 ? Exact{modByZero} : Exact{"", static_cast<std::int64_t>(I128{x} % I128{y})}, x,
             y);
}

// The 32-bit ROUND and TRUNCATE: the 64-bit models' value where it fits 32
// bits, and 03 where it does not or where 10^-n has no double.
orv::model::Exact in32Bits(const orv::model::Exact &v, std::int32_t n) {
  if (n < -308 || v.value < INT32_MIN || v.value > INT32_MAX) return {"03"};
  return v;
}

// a to the power b in exact arithmetic, only as far as it passes 2^32 in
// magnitude; a negative power rounded half away from zero.
I128 power32(std::int32_t a, std::int32_t b) {
  const I128 sign = a < 0 && b % 2 != 0 ? -1 : 1;
  if (a == 1 || a == -1) return sign;
  if (b < 0) return b == -1 && (a == 2 || a == -2) ? sign : 0;
  if (a == 0) return b == 0 ? 1 : 0;
  I128 p = 1;
  for (std::int32_t k = 0; k < b && p > -(I128{1} << 32) && p < I128{1} << 32; ++k) p *= a;
  return p;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
  keepLastInput(data, size);
  const auto x = take<double>(data, size), y = take<double>(data, size);
  const auto a = take<std::int32_t>(data, size), b = take<std::int32_t>(data, size);
  const auto c = take<std::int16_t>(data, size), d = take<std::int16_t>(data, size);
  const auto e = take<std::int64_t>(data, size), f = take<std::int64_t>(data, size);
  const auto n = take<std::int32_t>(data, size);
  const std::string_view text =
      upToNul(std::string_view(reinterpret_cast<const char *>(data), size));

  double r = 0;
  ORV_CHECK("CLI_udfABS1", call("CLI_udfABS1", r, false, x).empty() &&
                               bits(r) == (bits(x) & ~(std::uint64_t{1} << 63)));
  if (call("CLI_udfSIGN1", r, false, x).empty() && !std::isnan(x)) {
    ORV_CHECK("CLI_udfSIGN1", r == (x > 0 ? 1.0 : x < 0 ? -1.0 : 0.0));
  }
  ORV_CHECK("CLI_udfCEILING1",
            call("CLI_udfCEILING1", r, false, x).empty() && sameDouble(r, std::ceil(x)));
  ORV_CHECK("CLI_udfFLOOR1",
            call("CLI_udfFLOOR1", r, false, x).empty() && sameDouble(r, std::floor(x)));
  integers({"CLI_udfABS2", "CLI_udfSIGN2", "CLI_udfCEILING2", "CLI_udfFLOOR2", "CLI_udfMOD1"}, "02",
           a, b);
  integers({"CLI_udfABS3", "CLI_udfSIGN3", "CLI_udfCEILING3", "CLI_udfFLOOR3", "CLI_udfMOD2"}, "03",
           c, d);
  integers({"CLI_udfABS4", "CLI_udfSIGN4", "CLI_udfCEILING4", "CLI_udfFLOOR4", "CLI_udfMOD3"}, "03",
           e, f);

  exactly<std::int32_t>("CLI_udfROUND2", in32Bits(orv::model::round64(a, n), n), a, n);
  exactly<std::int32_t>("CLI_udfTRUNCATE2", in32Bits(orv::model::truncate64(a, n), n), a, n);
  // The double forms fail only where their power of ten is out of range.
  // Else ROUND1 moves a finite x by at most that power, and TRUNCATE1
  // keeps its sign and gives no more than its magnitude; either may
  // overflow to an infinity without a status.
  const double unit = std::pow(10.0, -static_cast<double>(n));
  const std::string roundCode = call("CLI_udfROUND1", r, false, x, n);
  ORV_CHECK("CLI_udfROUND1", roundCode == (n > 323 || n < -308 ? "03" : ""));
  if (roundCode.empty() && std::isfinite(x) && !std::isinf(r)) {
    ORV_CHECK("CLI_udfROUND1", std::fabs(r - x) <= unit * (1 + 1e-15) + std::fabs(x) * 1e-15);
  }
  const std::string truncateCode = call("CLI_udfTRUNCATE1", r, false, x, n);
  ORV_CHECK("CLI_udfTRUNCATE1", truncateCode == (n > 308 || n < -308 ? "03" : ""));
  if (truncateCode.empty() && std::isfinite(x) && x != 0) {
    ORV_CHECK("CLI_udfTRUNCATE1",
              std::signbit(r) == std::signbit(x) &&
                  (std::isinf(r) || std::fabs(r) <= std::fabs(x) * (1 + 1e-15) + 5e-324));
  }

  // Powers.
  if (call("CLI_udfPOWER1", r, true, x, y).empty()) {
    ORV_CHECK("CLI_udfPOWER1", sameDouble(r, std::pow(x, y)));
    if (std::isfinite(x) && std::isfinite(y)) ORV_CHECK("CLI_udfPOWER1", !std::isinf(r));
  }
  if (call("CLI_udfPOWER2", r, true, x, a).empty() && std::isfinite(x)) {
    ORV_CHECK("CLI_udfPOWER2", !std::isinf(r));
  }
  // POWER3 exactly: the power when it lies in [-2147483647, 2147483646]
  // (the half added before the range test rules out the two ends), a
  // fraction rounded half away from zero for a negative exponent, 03 where
  // pow underflows to zero.
  std::int32_t r32 = 0;
  const I128 power = power32(a, b);
  const std::string wantCode =
      a == 0 && b < 0                                                             ? "01"
      : std::pow(static_cast<double>(a), static_cast<double>(b)) == 0.0 && a != 0 ? "03"
      : power < -2147483647 || power > 2147483646                                 ? "03"
                                                                                  : "";
  ORV_CHECK("CLI_udfPOWER3", call("CLI_udfPOWER3", r32, false, a, b) == wantCode &&
                                 (!wantCode.empty() || r32 == power));
  // The 64-bit forms, exactly.
  exactly<std::int64_t>("CLI_udfPOWER4", orv::model::power64(e, f), e, f);
  exactly<std::int64_t>("CLI_udfROUND5", orv::model::round64(e, n), e, n);
  exactly<std::int64_t>("CLI_udfTRUNCATE5", orv::model::truncate64(e, n), e, n);

  // Elementary functions of the C maths library.
  const std::pair<const char *, double (*)(double)> maths[] = {
      {"CLI_udfSIN", [](double v) { return std::sin(v); }},
      {"CLI_udfCOS", [](double v) { return std::cos(v); }},
      {"CLI_udfTAN", [](double v) { return std::tan(v); }},
      {"CLI_udfASIN", [](double v) { return std::asin(v); }},
      {"CLI_udfACOS", [](double v) { return std::acos(v); }},
      {"CLI_udfATAN", [](double v) { return std::atan(v); }},
      {"CLI_udfLOG", [](double v) { return std::log(v); }},
      {"CLI_udfLOG10", [](double v) { return std::log10(v); }},
      {"CLI_udfEXP", [](double v) { return std::exp(v); }},
      {"CLI_udfSQRT", [](double v) { return std::sqrt(v); }}};
  for (const auto &[name, fn] : maths) {
    if (call(name, r, true, x).empty()) {
      ORV_CHECK(name, sameDouble(r, fn(x)) && (!std::isfinite(x) || !std::isinf(r)));
    }
  }
  // COT is 1 / tan, 02 where tan gives a zero; 1e-310 gives an infinity.
  const std::string cotCode = call("CLI_udfCOT", r, true, x);
  ORV_CHECK("CLI_udfCOT", std::tan(x) == 0 ? cotCode == "02"
                                           : cotCode.empty() && sameDouble(r, 1.0 / std::tan(x)));
  // ATAN2(a, b) is the standard atan2(b, a).
  if (call("CLI_udfATAN2", r, true, x, y).empty())
    ORV_CHECK("CLI_udfATAN2", sameDouble(r, std::atan2(y, x)));
  // DEGREES and RADIANS within two roundings of the exact ratio, or an
  // infinity where the product with 180 or pi overflows.
  const long double pi = 3.141592653589793238462643383279502884L;
  for (const auto &[name, ratio, factor] :
       {std::tuple{"CLI_udfDEGREES1", 180.0L / pi, 180.0},
        std::tuple{"CLI_udfRADIANS1", pi / 180.0L, std::numbers::pi}}) {
    ORV_CHECK(name, call(name, r, false, x).empty());
    const long double want = static_cast<long double>(x) * ratio;
    if (std::isfinite(x) && std::isfinite(factor * x)) {
      ORV_CHECK(name, std::fabs(static_cast<long double>(r) - want) <=
                          std::fabs(want) * 0x1p-50L + 0x1p-1070L);
    } else if (std::isinf(x) || std::isinf(factor * x)) {
      ORV_CHECK(name, std::isinf(r) && std::signbit(r) == std::signbit(x));
    }
  }

  // DOUBLETOCHAR: 24 bytes, the short text then blanks, no NUL.
  Call toText("CLI_udfDOUBLETOCHAR");
  toText.input(numberBlock(x)).result(Block(24));
  ORV_CHECK(toText.name(), toText.run().empty());
  const std::string_view shown = toText.out().view();
  ORV_CHECK(toText.name(), shown.find('\0') == std::string_view::npos);
  const std::string_view number = shown.substr(0, shown.find(' '));
  ORV_CHECK(toText.name(), shown.find_first_not_of(' ', number.size()) == std::string_view::npos);
  if (x == 0) ORV_CHECK(toText.name(), number == "0E0");
  if (std::isfinite(x) && x != 0) {
    const std::string copy(number);
    char *end = nullptr;
    const double back = std::strtod(copy.c_str(), &end);
    ORV_CHECK(toText.name(), end == copy.c_str() + copy.size());
    ORV_CHECK(toText.name(), std::fabs(back - x) <= std::fabs(x) * 1e-14 || std::isinf(back));
  }

  // CHARTODOUBLE of the text, and of DOUBLETOCHAR's text.
  for (const std::string_view t : {text, number}) {
    Call toNumber("CLI_udfCHARTODOUBLE");
    toNumber.input(textBlock(t)).result(Block(8));
    if (!toNumber.run().empty()) continue;
    const auto got = numberIn<double>(toNumber.out());
    ORV_CHECK(toNumber.name(), std::isfinite(got));
    const std::string trimmed(t.substr(0, t.find_last_not_of(" \t\n\v\f\r") + 1));
    char *end = nullptr;
    const double want = std::strtod(trimmed.c_str(), &end);
    ORV_CHECK(toNumber.name(), end == trimmed.c_str() + trimmed.size() && sameDouble(got, want));
  }
  return 0;
}
