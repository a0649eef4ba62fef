// CHARTODOUBLE and DOUBLETOCHAR: number text through the engine's number
// services.  The services do the reading and the formatting; the routines
// trim before the one and shorten the other's fixed-width output.
#include <cstdint>
#include <cstring>

#include "engine/services.h"
#include "frame/frame.hpp"
#include "routines.hpp"

namespace {

// The white space that CHARTODOUBLE cuts from the end.
constexpr bool isTrailingSpace(char c) {
  return c == ' ' || c == '\t' || c == '\n' || c == '\r' || c == '\v' || c == '\f';
}

constexpr std::size_t kRaw = 22;  // sign, digit, point, 14 digits, E, sign, 3 digits

// Which raw indexes the short form keeps: the bit 0x80000000 >> i for index i.
constexpr std::uint32_t bitOf(std::size_t i) { return 0x80000000u >> i; }

// Shortens raw number text: no plus signs, no leading exponent zeros (one
// exponent digit stays), no trailing digit zeros (one stays behind the
// point); the fixed width filled up with blanks.
void shorten(const char *raw, char *out, std::size_t width) {
  std::uint32_t mask = raw[18] == '+' ? 0xFFFFDC00u : 0xFFFFFC00u;
  for (std::size_t i = 19; i <= 20 && raw[i] == '0'; ++i) mask &= ~bitOf(i);
  if (raw[0] == '+') mask &= ~bitOf(0);
  for (std::size_t i = 16; i >= 4 && raw[i] == '0'; --i) mask &= ~bitOf(i);
  std::size_t n = 0;
  for (std::size_t i = 0; i <= 20; ++i) {
    if ((mask & bitOf(i)) != 0) out[n++] = raw[i];
  }
  out[n++] = raw[21];
  std::memset(out + n, ' ', width - n);
}

static_assert(kRaw + 1 == 23);

}  // namespace

namespace cli {

// Cuts trailing white space in the caller's buffer, then asks the number
// service, which writes the result itself; leading white space is the
// service's to judge.
Report routine::CHARTODOUBLE(WritableTextIn text, double *result) noexcept {
  char *chars = text.chars();
  const std::size_t full = std::strlen(chars);
  std::size_t n = full;
  while (n > 0 && isTrailingSpace(chars[n - 1])) --n;
  if (n != full) chars[n] = '\0';
  if (sqlrxa2f(chars, static_cast<std::uint32_t>(n), result, sizeof(double)) != 0) {
    return Sysfun::notANumber;
  }
  return {};
}

// Zero of either sign is 0E0; everything else, a NaN too, goes through the
// formatting service with 15 significant digits.
Report routine::DOUBLETOCHAR(double x, FixedTextOut result) noexcept {
  char *out = result.chars();
  char raw[kRaw + 1] = {};
  if (x == 0.0) {
    out[0] = '0';
    out[1] = 'E';
    out[2] = '0';
    std::memset(out + 3, ' ', result.size() - 3);
    return {};
  }
  sqlrxf2a(&x, 15, raw, sizeof(double));
  shorten(raw, out, result.size());
  return {};
}

}  // namespace cli
