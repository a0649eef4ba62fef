// ROUND, TRUNCATE and POWER of 64-bit integers worked out again in exact
// 128-bit arithmetic: the reference that the unit tests and the fuzz target
// compare the 64-bit exports with.
#pragma once

#include <cstdint>
#include <string>

namespace orv::model {

struct Exact {
  std::string code;  // the SYSFUN code, empty on success
  std::int64_t value = 0;
};

__extension__ using Int128 = __int128;

// 10^k, k from 0 up; from 10^30 on every 64-bit value cuts to 0 all the same.
inline Int128 tenTo(std::int64_t k) {
  Int128 p = 1;
  for (std::int64_t i = 0; i < k && i < 30; ++i) p *= 10;
  return p;
}

inline Exact exact(Int128 v) {
  if (v < INT64_MIN || v > INT64_MAX) return {"03"};
  return {"", static_cast<std::int64_t>(v)};
}

// x cut toward zero to a multiple of 10^-n, and for ROUND one multiple
// further from zero when the highest digit cut off is 5 or more.
inline Exact round64(std::int64_t x, std::int32_t n) {
  if (n >= 0) return {"", x};
  const Int128 unit = tenTo(-std::int64_t{n} - 1), scale = unit * 10, below = x / unit % 10;
  return exact(scale * (x / scale + (below >= 5 ? 1 : below <= -5 ? -1 : 0)));
}

inline Exact truncate64(std::int64_t x, std::int32_t n) {
  if (n >= 0) return {"", x};
  const Int128 scale = tenTo(-std::int64_t{n});
  return exact(x / scale * scale);
}

// x multiplied y times, failing as soon as the product leaves 64 bits.
inline Exact power64(std::int64_t x, std::int64_t y) {
  if (x == 0) return y > 0 ? Exact{"", 0} : Exact{"01"};
  if (y == 0 || x == 1) return {"", 1};
  if (y < 0) return {"", 0};
  if (x == -1) return {"", y % 2 == 0 ? 1 : -1};
  Int128 product = 1;
  for (std::int64_t i = 0; i < y; ++i) {
    product *= x;
    if (!exact(product).code.empty()) return {"03"};
  }
  return exact(product);
}

}  // namespace orv::model
