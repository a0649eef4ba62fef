// The portable filter kernel and the SSE2 one, and the choice among all.
#include "string/search_kernels.hpp"

#include <cstring>

#if defined(__x86_64__) || defined(_M_X64)
#include <emmintrin.h>
#endif

#include "string/search_kernel_loop.hpp"

namespace {

// Sixteen lanes in two 64-bit words, 0x80 in each lane that holds.
struct PortableLanes {
  static constexpr std::size_t kCount = 16;
  struct Vector {
    std::uint64_t lo, hi;
  };
  static Vector splat(unsigned char b) noexcept {
    const std::uint64_t w = 0x0101010101010101ULL * b;
    return {w, w};
  }
  static Vector equal(const unsigned char *p, Vector b) noexcept {
    std::uint64_t lo = 0, hi = 0;
    std::memcpy(&lo, p, 8);
    std::memcpy(&hi, p + 8, 8);
    return {zeroBytes(lo ^ b.lo), zeroBytes(hi ^ b.hi)};
  }
  static Vector both(Vector a, Vector b) noexcept { return {a.lo & b.lo, a.hi & b.hi}; }
  static std::uint64_t bits(Vector v) noexcept { return gather(v.lo) | gather(v.hi) << 8; }
  static Vector zero() noexcept { return {0, 0}; }
  static Vector plusOnes(Vector acc, Vector v) noexcept {
    return {acc.lo + (v.lo >> 7), acc.hi + (v.hi >> 7)};  // bytes of at most 255: no carry
  }
  static std::size_t sum(Vector acc) noexcept { return sumBytes(acc.lo) + sumBytes(acc.hi); }

  // 0x80 in exactly the bytes of w that are zero.
  static std::uint64_t zeroBytes(std::uint64_t w) noexcept {
    constexpr std::uint64_t low7 = 0x7F7F7F7F7F7F7F7FULL;
    return ~(((w & low7) + low7) | w | low7);
  }
  static std::size_t sumBytes(std::uint64_t w) noexcept {
    constexpr std::uint64_t evenBytes = 0x00FF00FF00FF00FFULL;
    const std::uint64_t pairs = (w & evenBytes) + ((w >> 8) & evenBytes);  // four 16-bit sums
    return static_cast<std::size_t>((pairs * 0x0001000100010001ULL) >> 48);
  }
  // The high bit of each byte, byte i to bit i (little-endian words).
  static std::uint64_t gather(std::uint64_t highBits) noexcept {
    return ((highBits >> 7) * 0x0102040810204080ULL) >> 56;
  }
};

#if defined(__x86_64__) || defined(_M_X64)
struct Sse2Lanes {
  static constexpr std::size_t kCount = 16;
  using Vector = __m128i;
  static Vector splat(unsigned char b) noexcept { return _mm_set1_epi8(static_cast<char>(b)); }
  static Vector equal(const unsigned char *p, Vector b) noexcept {
    // NOLINTNEXTLINE(cppcoreguidelines-pro-type-reinterpret-cast): an unaligned load
    return _mm_cmpeq_epi8(_mm_loadu_si128(reinterpret_cast<const __m128i *>(p)), b);
  }
  static Vector both(Vector a, Vector b) noexcept { return _mm_and_si128(a, b); }
  static std::uint64_t bits(Vector v) noexcept {
    return static_cast<std::uint32_t>(_mm_movemask_epi8(v));
  }
  static Vector zero() noexcept { return _mm_setzero_si128(); }
  static Vector plusOnes(Vector acc, Vector v) noexcept { return _mm_sub_epi8(acc, v); }
  static std::size_t sum(Vector acc) noexcept {
    const __m128i halves = _mm_sad_epu8(acc, _mm_setzero_si128());
    return static_cast<std::size_t>(_mm_cvtsi128_si64(halves)) +
           static_cast<std::size_t>(_mm_cvtsi128_si64(_mm_unpackhi_epi64(halves, halves)));
  }
};
#endif

}  // namespace

namespace cli::str {

const FilterKernel kPortableKernel = {PortableLanes::kCount, scanWith<PortableLanes>,
                                      agree64With<PortableLanes>, countWith<PortableLanes>};

#if defined(__x86_64__) || defined(_M_X64)
const FilterKernel kSse2Kernel = {Sse2Lanes::kCount, scanWith<Sse2Lanes>, agree64With<Sse2Lanes>,
                                  countWith<Sse2Lanes>};

const FilterKernel &bestFilterKernel() noexcept {
  // The compiler's check reads what the processor reports once at start-up,
  // including whether the operating system saves the wide registers.
  return __builtin_cpu_supports("avx2") ? kAvx2Kernel : kSse2Kernel;
}
#else
const FilterKernel &bestFilterKernel() noexcept { return kPortableKernel; }
#endif

}  // namespace cli::str
