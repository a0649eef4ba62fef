// What differs between the platforms the library is built for, in one
// place: how an export is marked, the system clock, the path separator,
// the range of the C library's rand and the powers of ten of ROUND and
// TRUNCATE.  Everything else in the library is the
// same source on every platform.
//
// `long` is 32 bits on 64-bit Windows and 64 bits on Linux; the library
// never uses it (fields are read into std::int64_t by hand), so nothing
// depends on its width.
#pragma once

#include <cmath>
#include <cstdlib>
#include <ctime>

// Marks a definition as one of the library's exports.  The build also hands
// the linker the exact list of exports (a version script on Linux, a module
// definition file on Windows), so a missing mark or an extra symbol is
// caught either way.
#if defined(_WIN32)
#define CLI_EXPORT extern "C" __declspec(dllexport)
#else
#define CLI_EXPORT extern "C" __attribute__((visibility("default")))
#endif

namespace cli::platform {

// The separator between the parts of a file path.
#if defined(_WIN32)
inline constexpr const char *kPathSeparator = "\\";
#else
inline constexpr const char *kPathSeparator = "/";
#endif

// The current time broken down in Coordinated Universal Time, read once.
inline std::tm utcNow() noexcept {
  std::tm parts{};
#if defined(_WIN32)
  const __time64_t now = _time64(nullptr);
  _gmtime64_s(&parts, &now);
#else
  const std::time_t now = std::time(nullptr);
  gmtime_r(&now, &parts);
#endif
  return parts;
}

// How many random bits each value of the C library's rand holds: 15 where
// RAND_MAX is 32767 (Windows), 31 on glibc.
inline constexpr int kRandomBits = [] {
  int bits = 0;
  for (unsigned long long m = RAND_MAX; m != 0; m >>= 1) ++bits;
  return bits;
}();
static_assert(kRandomBits >= 15 && (RAND_MAX & (RAND_MAX + 1ULL)) == 0,
              "rand must give a whole number of random bits, at least 15");

// 10 to the power `e`, as the C library's pow gives it.  glibc's pow is
// correctly rounded here; mingw-w64's is one unit in the last place off for
// some negative whole exponents (10^-2 among them).  On Windows whole
// exponents from -22 to 22 are therefore computed from the exact powers
// 10^0 to 10^22, a division giving the correctly rounded 10^-k, so that
// ROUND and TRUNCATE give the same bits on both platforms.
inline double powerOfTen(double e) noexcept {
#if defined(_WIN32)
  if (e == std::floor(e) && std::fabs(e) <= 22.0) {
    double exact = 1.0;
    for (int k = static_cast<int>(std::fabs(e)); k > 0; --k) exact *= 10.0;  // exact up to 10^22
    return e < 0.0 ? 1.0 / exact : exact;
  }
#endif
  return std::pow(10.0, e);
}

}  // namespace cli::platform
