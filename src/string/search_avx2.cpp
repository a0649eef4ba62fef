// The AVX2 filter kernel: 32 positions a block.  This file alone is
// compiled for AVX2; bestFilterKernel() uses it only where it runs.
#include <immintrin.h>

#include "string/search_kernel_loop.hpp"
#include "string/search_kernels.hpp"

namespace {

struct Avx2Lanes {
  static constexpr std::size_t kCount = 32;
  using Vector = __m256i;
  static Vector splat(unsigned char b) noexcept { return _mm256_set1_epi8(static_cast<char>(b)); }
  static Vector equal(const unsigned char *p, Vector b) noexcept {
    // NOLINTNEXTLINE(cppcoreguidelines-pro-type-reinterpret-cast): an unaligned load
    return _mm256_cmpeq_epi8(_mm256_loadu_si256(reinterpret_cast<const __m256i *>(p)), b);
  }
  static Vector both(Vector a, Vector b) noexcept { return _mm256_and_si256(a, b); }
  static std::uint64_t bits(Vector v) noexcept {
    return static_cast<std::uint32_t>(_mm256_movemask_epi8(v));
  }
  static Vector zero() noexcept { return _mm256_setzero_si256(); }
  static Vector plusOnes(Vector acc, Vector v) noexcept { return _mm256_sub_epi8(acc, v); }
  static std::size_t sum(Vector acc) noexcept {
    const __m256i quarters = _mm256_sad_epu8(acc, _mm256_setzero_si256());
    const __m128i halves =
        _mm_add_epi64(_mm256_castsi256_si128(quarters), _mm256_extracti128_si256(quarters, 1));
    return static_cast<std::size_t>(_mm_cvtsi128_si64(halves)) +
           static_cast<std::size_t>(_mm_cvtsi128_si64(_mm_unpackhi_epi64(halves, halves)));
  }
};

}  // namespace

namespace cli::str {

const FilterKernel kAvx2Kernel = {Avx2Lanes::kCount, scanWith<Avx2Lanes>, agree64With<Avx2Lanes>,
                                  countWith<Avx2Lanes>};

}  // namespace cli::str
