// Finding one byte string in another in linear time and constant space.
//
// The routines are defined as left-to-right searches (try each position,
// a failed comparison moves on by one byte), which is quadratic on inputs
// such as a needle of 3999 'a' and a 'b' in a megabyte of 'a'.  The
// Two-Way algorithm of Crochemore and Perrin finds the same first match in
// at most about 2n comparisons with O(1) memory, so nothing is allocated.
// memchr on the first byte that each attempt compares skips positions that
// cannot match; it only moves forward, so the bound holds.  Comparisons go
// a word at a time, on little-endian machines (all that we build for).
//
// The C library's memmem would do, but is not linear on every platform and
// missing on some, so the library carries its own.
#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "frame/frame.hpp"

namespace cli::str {

inline constexpr std::size_t kNotFound = static_cast<std::size_t>(-1);

static_assert(std::endian::native == std::endian::little, "word compares assume little-endian");

class Searcher {
 public:
  explicit Searcher(Bytes needle) noexcept : x_(needle.data), m_(needle.size) {
    if (m_ < 2) return;
    // The critical factorization: the later of the two maximal suffixes,
    // under the byte order and under its reverse.
    const Suffix forward = maximalSuffix(false);
    const Suffix reverse = maximalSuffix(true);
    const Suffix &critical = reverse.start + 1 < forward.start + 1 ? forward : reverse;
    suffix_ = critical.start + 1;
    period_ = critical.period;
    periodic_ = std::memcmp(x_, x_ + period_, suffix_) == 0;
    if (!periodic_) period_ = (suffix_ > m_ - suffix_ ? suffix_ : m_ - suffix_) + 1;
  }

  // The first position at or after `from` where the needle stands in
  // `haystack` in full, or kNotFound.  An empty needle stands at `from`.
  [[nodiscard]] std::size_t find(Bytes haystack, std::size_t from) const noexcept {
    if (from > haystack.size || m_ > haystack.size - from) return kNotFound;
    const Byte *h = haystack.data + from;
    const std::size_t n = haystack.size - from;
    if (m_ == 0) return from;
    if (m_ == 1) {
      const void *hit = std::memchr(h, x_[0], n);
      return hit == nullptr ? kNotFound
                            : from + static_cast<std::size_t>(static_cast<const Byte *>(hit) - h);
    }
    const std::size_t at = periodic_ ? findPeriodic(h, n) : findAperiodic(h, n);
    return at == kNotFound ? kNotFound : from + at;
  }

 private:
  struct Suffix {
    std::size_t start;  // one before the suffix; kNotFound (as -1) for the whole needle
    std::size_t period;
  };

  // The maximal suffix of the needle and its period, by Crochemore and
  // Perrin; unsigned arithmetic wraps start from -1 on purpose.
  [[nodiscard]] Suffix maximalSuffix(bool reversed) const noexcept {
    std::size_t start = kNotFound, j = 0, k = 1, p = 1;
    while (j + k < m_) {
      const Byte a = x_[j + k], b = x_[start + k];
      if (reversed ? b < a : a < b) {
        j += k;
        k = 1;
        p = j - start;
      } else if (a == b) {
        if (k != p) {
          ++k;
        } else {
          j += p;
          k = 1;
        }
      } else {
        start = j++;
        k = p = 1;
      }
    }
    return {start, p};
  }

  // The first i in [from, m) where the needle and the haystack at j
  // differ, or m; compared a word at a time.
  [[nodiscard]] std::size_t mismatchForward(const Byte *h, std::size_t from) const noexcept {
    std::size_t i = from;
    for (; i + 8 <= m_; i += 8) {
      const std::uint64_t d = word(x_ + i) ^ word(h + i);
      if (d != 0) return i + lowestByte(d);
    }
    while (i < m_ && x_[i] == h[i]) ++i;
    return i;
  }

  // Going down from `from` (exclusive) to `floor`: the highest i below
  // `from` where they differ, or floor - 1 (wrapping) when all match.
  [[nodiscard]] std::size_t mismatchBackward(const Byte *h, std::size_t from,
                                             std::size_t floor) const noexcept {
    std::size_t i = from;
    for (; i >= floor + 8; i -= 8) {
      const std::uint64_t d = word(x_ + i - 8) ^ word(h + i - 8);
      if (d != 0) return i - 1 - highestByte(d);
    }
    while (i > floor && x_[i - 1] == h[i - 1]) --i;
    return i - 1;
  }

  static std::uint64_t word(const Byte *p) noexcept {
    std::uint64_t w = 0;
    std::memcpy(&w, p, sizeof w);
    return w;
  }
  // Byte offsets, in memory order, of the lowest and highest differing
  // byte of a non-zero XOR of two little-endian words.
  static std::size_t lowestByte(std::uint64_t d) noexcept {
    return static_cast<std::size_t>(std::countr_zero(d)) / 8;
  }
  static std::size_t highestByte(std::uint64_t d) noexcept {
    return static_cast<std::size_t>(std::countl_zero(d)) / 8;
  }

  // Moves j to the next position whose first compared byte matches, or
  // gives false when no position is left.
  bool skip(const Byte *h, std::size_t n, std::size_t &j) const noexcept {
    const void *hit = std::memchr(h + j + suffix_, x_[suffix_], n - m_ - j + 1);
    if (hit == nullptr) return false;
    j = static_cast<std::size_t>(static_cast<const Byte *>(hit) - h) - suffix_;
    return true;
  }

  std::size_t findPeriodic(const Byte *h, std::size_t n) const noexcept {
    std::size_t j = 0, memory = 0;
    while (j <= n - m_) {
      if (memory == 0 && !skip(h, n, j)) return kNotFound;
      std::size_t i = mismatchForward(h + j, suffix_ > memory ? suffix_ : memory);
      if (i >= m_) {
        i = mismatchBackward(h + j, suffix_, memory);
        if (i + 1 < memory + 1) return j;
        j += period_;
        memory = m_ - period_;
      } else {
        j += i - suffix_ + 1;
        memory = 0;
      }
    }
    return kNotFound;
  }

  std::size_t findAperiodic(const Byte *h, std::size_t n) const noexcept {
    std::size_t j = 0;
    while (j <= n - m_) {
      if (!skip(h, n, j)) return kNotFound;
      std::size_t i = mismatchForward(h + j, suffix_);
      if (i >= m_) {
        i = mismatchBackward(h + j, suffix_, 0);
        if (i == kNotFound) return j;
        j += period_;
      } else {
        j += i - suffix_ + 1;
      }
    }
    return kNotFound;
  }

  const Byte *x_;
  std::size_t m_;
  std::size_t suffix_ = 0;
  std::size_t period_ = 1;
  bool periodic_ = false;
};

}  // namespace cli::str
