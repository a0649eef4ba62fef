// The filter's loop over blocks of positions, written once over a lane
// type and included by each kernel file inside an anonymous namespace, so
// that every file has its own copy, compiled for its own instruction set.
//
// A lane type L gives: kCount, the positions of one block (at most 64);
// Vector; splat(byte); equal(pointer, vector), all ones in the lanes where
// the bytes at the pointer equal the vector's; both(a, b); and bits(v),
// one bit per lane; and for counting, zero(), plusOnes(acc, v), which adds
// one to each byte of acc where v's lane is all ones, and sum(acc), the sum
// of acc's bytes.
#pragma once

#include <cstddef>
#include <cstdint>

#include "string/search_kernels.hpp"

// NOLINTBEGIN(cert-dcl59-cpp, google-build-namespaces): one copy per kernel file
namespace {

template <class L, std::size_t K>
std::size_t scanBy(const unsigned char *h, std::size_t j, std::size_t last,
                   const cli::str::Probes &probes, std::uint64_t &mask) noexcept {
  constexpr std::size_t n = L::kCount;
  constexpr auto none = static_cast<std::size_t>(-1);
  std::size_t offset[K];
  typename L::Vector lane[K];
#pragma GCC unroll 8
  for (std::size_t k = 0; k < K; ++k) {
    const std::size_t from = k < probes.count ? k : 0;  // fewer probes repeat the first
    offset[k] = probes.offset[from];
    lane[k] = L::splat(probes.byte[from]);
  }
  // Unrolled, so that the probes stay in registers.
  const auto passing = [&](const unsigned char *at) {
    typename L::Vector all = L::equal(at + offset[0], lane[0]);
#pragma GCC unroll 8
    for (std::size_t k = 1; k < K; ++k) all = L::both(all, L::equal(at + offset[k], lane[k]));
    return L::bits(all);
  };
  // Two whole blocks a round, then one, then the last positions as the end
  // of a block that reaches back over positions already tested.
  for (; j + 2 * n - 1 <= last; j += 2 * n) {
    const std::uint64_t first = passing(h + j), second = passing(h + j + n);
    if ((first | second) != 0) {
      mask = first != 0 ? first : second;
      return first != 0 ? j : j + n;
    }
  }
  for (; j + n - 1 <= last; j += n) {
    const std::uint64_t m = passing(h + j);
    if (m != 0) {
      mask = m;
      return j;
    }
  }
  if (j > last) return none;
  std::uint64_t m = 0;
  if (last + 1 >= n) {
    m = passing(h + last - (n - 1)) >> (j + n - 1 - last);
  } else {  // fewer positions in the whole haystack than one block
    for (std::size_t p = j; p <= last; ++p) {
      bool pass = true;
      for (std::size_t k = 0; k < probes.count; ++k) {
        pass = pass && h[p + probes.offset[k]] == probes.byte[k];
      }
      m |= std::uint64_t{pass} << (p - j);
    }
  }
  if (m == 0) return none;
  mask = m;
  return j;
}

// Two, four or eight probes: the loop is unrolled for each.
template <class L>
std::size_t scanWith(const unsigned char *h, std::size_t j, std::size_t last,
                     const cli::str::Probes &probes, std::uint64_t &mask) noexcept {
  if (probes.count <= 2) return scanBy<L, 2>(h, j, last, probes, mask);
  if (probes.count <= 4) return scanBy<L, 4>(h, j, last, probes, mask);
  return scanBy<L, 8>(h, j, last, probes, mask);
}

template <class L>
std::uint64_t agree64With(const unsigned char *at, unsigned char byte) noexcept {
  const typename L::Vector b = L::splat(byte);
  std::uint64_t bits = 0;
  for (std::size_t q = 0; q < 64; q += L::kCount) bits |= L::bits(L::equal(at + q, b)) << q;
  return bits;
}

template <class L>
std::size_t countWith(const unsigned char *at, std::size_t n, unsigned char byte) noexcept {
  const typename L::Vector b = L::splat(byte);
  std::size_t total = 0, i = 0;
  // Each byte of the accumulator counts up to 255 blocks before it is summed.
  while (n - i >= L::kCount) {
    typename L::Vector acc = L::zero();
    for (std::size_t blocks = 0; blocks < 255 && n - i >= L::kCount; ++blocks, i += L::kCount) {
      acc = L::plusOnes(acc, L::equal(at + i, b));
    }
    total += L::sum(acc);
  }
  for (; i < n; ++i) total += at[i] == byte ? 1 : 0;
  return total;
}

}  // namespace
// NOLINTEND(cert-dcl59-cpp, google-build-namespaces)
