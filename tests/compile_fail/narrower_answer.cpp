// A 32-bit result is not given back in a 16-bit Answer, although every
// value would widen into it.
#include "probe.hpp"

namespace probe {
cli::Answer<std::int16_t> abs(std::int32_t x) noexcept;
}  // namespace probe

#ifdef ORV_COMPILE_PROBES
[[maybe_unused]] auto *const kAbs = &probe::abs2<probe::abs>;
#endif
