// The inner loop of the search's filter, once per instruction set.
//
// A filter holds up to eight probes, each an offset into the needle and the
// needle's byte there.  A position passes when the haystack holds every
// probe's byte at the position plus the probe's offset.  A kernel tests a
// block of positions at once (16 with SSE2, 32 with AVX2) and reports the
// first block in which any position passes.
//
// The kernels live in their own files, compiled for their own instruction
// set, and share nothing inline with the rest of the library, so that no
// function compiled for AVX2 can stand in for one that runs everywhere.
// bestFilterKernel() picks the widest one that this processor and its
// operating system run.
#pragma once

#include <cstddef>
#include <cstdint>

namespace cli::str {

struct Probes {
  static constexpr std::size_t kMax = 8;
  std::size_t count;  // 1 to kMax
  std::size_t offset[kMax];
  unsigned char byte[kMax];
};

struct FilterKernel {
  // Positions tested at once, at most 64.
  std::size_t lanes;
  // The first block of positions, from `j` on and none past `last`, in which
  // some position passes the probes: its first position, with the passing
  // positions in `mask` (bit i for the block's first position plus i).
  // `j` <= `last`, and every probe's offset plus `last` lies in the
  // haystack.  Returns SIZE_MAX when no position passes.
  std::size_t (*scan)(const unsigned char *haystack, std::size_t j, std::size_t last,
                      const Probes &probes, std::uint64_t &mask) noexcept;
  // Bit i set where at[i] == byte, for i below 64.
  std::uint64_t (*agree64)(const unsigned char *at, unsigned char byte) noexcept;
  // How many of the n bytes at `at` equal `byte`.
  std::size_t (*count)(const unsigned char *at, std::size_t n, unsigned char byte) noexcept;
};

// The same filter in plain C++, for every machine.
extern const FilterKernel kPortableKernel;
#if defined(__x86_64__) || defined(_M_X64)
extern const FilterKernel kSse2Kernel;
extern const FilterKernel kAvx2Kernel;
#endif

// The widest kernel that runs here.
const FilterKernel &bestFilterKernel() noexcept;

}  // namespace cli::str
