// RAND: a pseudo-random double from 0.0 to 1.0, both ends included.
//
// The routines own no generator: they scale what the C library's rand
// delivers, and RAND2 seeds that same generator with srand once per
// statement.  The generator's state is the C library's, shared as it
// shares it; glibc guards it with a lock, so calls from many threads are
// safe but interleave their sequences.
#include <cstdint>
#include <cstdlib>

#include "frame/frame.hpp"
#include "routines.hpp"

namespace {

// rand's values reduced to 0..32767.  Where RAND_MAX is larger, as on
// glibc (2^31 - 1), the top 15 bits are kept: RAND_MAX + 1 is a power of
// two on the platforms we build for, so every value stays equally likely.
// Where it is 32767 (Windows) the shift is 0 and the value is used as is.
using cli::platform::kRandomBits;

double next() noexcept {
  // The C library's generator is the one whose sequence srand sets.
  const int r = std::rand() >> (kRandomBits - 15);  // NOLINT(cert-msc30-c,cert-msc50-cpp)
  // A division by 32767.0, not a multiplication by its inverse: 32767
  // gives exactly 1.0.
  return static_cast<double>(r) / 32767.0;
}

}  // namespace

namespace cli {

Answer<double> routine::RAND1() noexcept { return success(next()); }

// The scratchpad's data holds the seeded flag, one byte that the engine
// zero-fills for each statement; only the first call of a statement reads
// the seed.
Answer<double> routine::RAND2(std::int32_t seed, Scratchpad scratchpad) noexcept {
  if (scratchpad.load<std::uint8_t>() == 0) {
    scratchpad.save(std::uint8_t{1});
    std::srand(static_cast<unsigned>(seed));
  }
  return success(next());
}

}  // namespace cli
