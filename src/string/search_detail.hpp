// The searcher's small parts: word-at-a-time comparison of byte ranges,
// both ways, the first of eight bytes equal to one, and a rough table of how common each byte is in
// text.
#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "frame/frame.hpp"

namespace cli::str {

static_assert(std::endian::native == std::endian::little, "word compares assume little-endian");

namespace search_detail {

inline std::uint64_t word(const Byte *p) noexcept {
  std::uint64_t w = 0;
  std::memcpy(&w, p, sizeof w);
  return w;
}

// The first i in [from, to) where a[i] and b[i] differ, or `to`; a word at
// a time.
inline std::size_t mismatch(const Byte *a, const Byte *b, std::size_t from,
                            std::size_t to) noexcept {
  std::size_t i = from;
  for (; i + 8 <= to; i += 8) {
    const std::uint64_t d = word(a + i) ^ word(b + i);
    if (d != 0) return i + static_cast<std::size_t>(std::countr_zero(d)) / 8;
  }
  while (i < to && a[i] == b[i]) ++i;
  return i;
}

// The first i below 8 where p[i] == byte, or 8.  Only a zero byte of the
// difference sets its high bit with no borrow from below, so the lowest bit
// set marks the first equal byte.
inline std::size_t firstEqual(const Byte *p, Byte byte) noexcept {
  constexpr std::uint64_t ones = 0x0101010101010101ULL;
  const std::uint64_t d = word(p) ^ (ones * byte);
  const std::uint64_t zero = (d - ones) & ~d & (ones << 7);
  return zero == 0 ? 8 : static_cast<std::size_t>(std::countr_zero(zero)) / 8;
}

// Going down from `from` (exclusive) to `floor`: the highest i below `from`
// where a[i] and b[i] differ, or floor - 1 (wrapping) when all agree.
inline std::size_t mismatchDown(const Byte *a, const Byte *b, std::size_t from,
                                std::size_t floor) noexcept {
  std::size_t i = from;
  for (; i >= floor + 8; i -= 8) {
    const std::uint64_t d = word(a + i - 8) ^ word(b + i - 8);
    if (d != 0) return i - 1 - static_cast<std::size_t>(std::countl_zero(d)) / 8;
  }
  while (i > floor && a[i - 1] == b[i - 1]) --i;
  return i - 1;
}

// How common each byte is in text, coarsely: higher is more common.  Only
// the order matters.  Letters follow English, and the bytes of other
// scripts' UTF-8 sit in the middle.
inline constexpr std::array<std::uint8_t, 256> kByteRank = [] {
  std::array<std::uint8_t, 256> r{};
  for (std::size_t c = 0; c < 256; ++c) {
    r[c] = c < 0x20 ? 20 : c < 0x80 ? 110 : c < 0xC0 ? 130 : 90;  // controls, ASCII, UTF-8
  }
  r[0] = 60;
  r['\n'] = 180;
  r['\t'] = 120;
  const char *byFrequency = "etaoinshrdlcumwfgypbvkjxqz";  // most common first
  for (std::size_t i = 0; byFrequency[i] != '\0'; ++i) {
    const auto lower = static_cast<unsigned char>(byFrequency[i]);
    r[lower] = static_cast<std::uint8_t>(250 - 4 * i);
    r[lower - 'a' + 'A'] = static_cast<std::uint8_t>(170 - 2 * i);
  }
  for (char c = '0'; c <= '9'; ++c) r[static_cast<unsigned char>(c)] = 150;
  r[' '] = 255;
  for (const char c : {',', '.', '-', '_', '/', '"', '\'', '(', ')', ':', '=', ';'}) {
    r[static_cast<unsigned char>(c)] = 160;
  }
  return r;
}();

}  // namespace search_detail

}  // namespace cli::str
