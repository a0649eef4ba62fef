// Short strings, read and written a word at a time.
//
// Most SQL strings are short: these read and write them in at most four
// overlapping words (or bytes) each way, never outside [from, from + size),
// and call the C library only for longer ones.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace orv::host {

inline std::uint64_t word(const char *p) {
  std::uint64_t w = 0;
  std::memcpy(&w, p, sizeof w);
  return w;
}
inline std::uint32_t halfWord(const char *p) {
  std::uint32_t w = 0;
  std::memcpy(&w, p, sizeof w);
  return w;
}
constexpr bool hasZeroByte(std::uint64_t w) {
  return ((w - 0x0101010101010101u) & ~w & 0x8080808080808080u) != 0;
}

// Whether the `size` bytes at `p` hold a NUL.
[[gnu::always_inline]] inline bool holdsNul(const char *p, std::size_t size) {
  if (size >= 8 && size <= 16) return hasZeroByte(word(p)) || hasZeroByte(word(p + size - 8));
  if (size > 16 && size <= 32) {
    return hasZeroByte(word(p)) || hasZeroByte(word(p + 8)) || hasZeroByte(word(p + size - 16)) ||
           hasZeroByte(word(p + size - 8));
  }
  if (size >= 4 && size < 8) {
    return hasZeroByte(halfWord(p) | (std::uint64_t{0xFFFFFFFF} << 32)) ||
           hasZeroByte(halfWord(p + size - 4) | (std::uint64_t{0xFFFFFFFF} << 32));
  }
  return size != 0 && std::memchr(p, 0, size) != nullptr;
}

// Copies `size` bytes from `from` to `to`.
[[gnu::always_inline]] inline void copyShort(char *to, const char *from, std::size_t size) {
  if (size >= 8 && size <= 16) {
    const std::uint64_t head = word(from), tail = word(from + size - 8);
    std::memcpy(to, &head, 8);
    std::memcpy(to + size - 8, &tail, 8);
  } else if (size > 16 && size <= 32) {
    const std::uint64_t a = word(from), b = word(from + 8), c = word(from + size - 16),
                        d = word(from + size - 8);
    std::memcpy(to, &a, 8);
    std::memcpy(to + 8, &b, 8);
    std::memcpy(to + size - 16, &c, 8);
    std::memcpy(to + size - 8, &d, 8);
  } else if (size >= 4 && size < 8) {
    const std::uint32_t head = halfWord(from), tail = halfWord(from + size - 4);
    std::memcpy(to, &head, 4);
    std::memcpy(to + size - 4, &tail, 4);
  } else if (size != 0 && size < 4) {
    // One, two or three bytes: the first, the middle and the last.
    to[0] = from[0];
    to[size / 2] = from[size / 2];
    to[size - 1] = from[size - 1];
  } else if (size != 0) {
    std::memcpy(to, from, size);
  }
}

}  // namespace orv::host
