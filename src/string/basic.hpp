// Logic of the basic string routines, over plain byte ranges.
//
// Each function works the same for terminated text and CLI_udfLob: the
// export shims read the input in its layout, call in here, and complete the
// result in the layout of the result.  Checks of arguments against limits
// are the shims' business; everything here assumes they have passed.
#pragma once

#include <algorithm>
#include <cctype>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "frame/frame.hpp"

namespace cli::str {

// The blank set of RTRIM and LTRIM: space and tab, nothing else.
constexpr bool isTrimBlank(Byte b) noexcept { return b == 0x20 || b == 0x09; }

// tolower of a byte in the calling thread's locale.  On glibc tolower is a
// lookup in the locale's table, so the table is taken once per call
// instead of calling through for every byte.
class ByteLowering {
 public:
#if defined(__GLIBC__)
  ByteLowering() noexcept : table_(*__ctype_tolower_loc()) {}
  Byte operator()(Byte c) const noexcept { return static_cast<Byte>(table_[c]); }

 private:
  const std::int32_t *table_;
#else
  Byte operator()(Byte c) const noexcept { return static_cast<Byte>(std::tolower(c)); }
#endif
};

// Stores the lowered bytes of `in`, eight at a time where it can.
inline void lowerCase(Bytes in, Byte *out) noexcept {
  const ByteLowering lower;
  std::size_t i = 0;
  for (; i + 8 <= in.size; i += 8) {
    Byte block[8];
    for (std::size_t k = 0; k < 8; ++k) block[k] = lower(in.data[i + k]);
    std::memcpy(out + i, block, 8);
  }
  for (; i < in.size; ++i) out[i] = lower(in.data[i]);
}

// The input without its trailing blanks.
inline Bytes withoutTrailingBlanks(Bytes in) noexcept {
  std::size_t n = in.size;
  while (n > 0 && isTrimBlank(in.data[n - 1])) --n;
  return {in.data, n};
}

// The input without its leading blanks.
inline Bytes withoutLeadingBlanks(Bytes in) noexcept {
  std::size_t skip = 0;
  while (skip < in.size && isTrimBlank(in.data[skip])) ++skip;
  return {in.data + skip, in.size - skip};
}

inline void copy(Bytes in, Byte *out) noexcept {
  if (in.size != 0) std::memcpy(out, in.data, in.size);
}

// Writes `in` and then blanks up to `width` bytes (width >= in.size).
inline void padded(Bytes in, std::size_t width, Byte *out) noexcept {
  copy(in, out);
  std::memset(out + in.size, ' ', width - in.size);
}

// RIGHT: the last `width` bytes, or all of them followed by blanks.
inline void rightPadded(Bytes in, std::size_t width, Byte *out) noexcept {
  if (width <= in.size) {
    copy({in.data + (in.size - width), width}, out);
  } else {
    padded(in, width, out);
  }
}

// Writes `count` copies of `in` back to back.  The copies already written
// serve as the source of the next ones, so the cost is that of writing the
// result once, whatever the input's length.
inline void repeat(Bytes in, std::size_t count, Byte *out) noexcept {
  const std::size_t total = in.size * count;
  if (total == 0) return;
  if (in.size == 1) {
    std::memset(out, in.data[0], total);
    return;
  }
  std::memcpy(out, in.data, in.size);
  std::size_t done = in.size;
  while (done < total) {
    const std::size_t chunk = std::min(done, total - done);
    std::memcpy(out + done, out, chunk);
    done += chunk;
  }
}

// CHAR: the byte for a code, 0 as a blank and anything outside 0 to 255 as 0xFF.
constexpr Byte charOfCode(std::int32_t v) noexcept {
  if (v == 0) return 0x20;
  if (v < 0 || v > 255) return 0xFF;
  return static_cast<Byte>(v);
}

}  // namespace cli::str
