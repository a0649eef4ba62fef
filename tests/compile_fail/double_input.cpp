// A 32-bit input is not handed to a double, although every value would
// convert to one.
#include "probe.hpp"

namespace probe {
cli::Answer<std::int32_t> abs(double x) noexcept;
}  // namespace probe

#ifdef ORV_COMPILE_PROBES
[[maybe_unused]] auto *const kAbs = &probe::abs2<probe::abs>;
#endif
